// Proofs: which keys were proved to be on a card, by whom, a short time ago.
//
// A pairing needs the proof of the same user for the same key, and uses it up.
//
// Units:   milliseconds of a clock that never goes back.
// Threads: one. Errors: none.

#pragma once

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <utility>

#include "platform/types.h"

namespace vlm::service {

class Proofs {
public:
    using Clock = std::function<std::int64_t()>;
    static constexpr std::int64_t kValidFor = 60'000;

    explicit Proofs(Clock clock) : _clock(std::move(clock)) {}

    void remember(platform::UserId user, const platform::Bytes& hash) {
        const auto now = _clock();
        std::erase_if(_endOf, [&](const auto& proof) { return proof.second <= now; });
        _endOf[{user, hash}] = now + kValidFor;
    }

    bool hold(platform::UserId user, const platform::Bytes& hash) const {
        const auto found = _endOf.find({user, hash});
        return found != _endOf.end() && _clock() < found->second;
    }

    void useUp(platform::UserId user, const platform::Bytes& hash) { _endOf.erase({user, hash}); }

    // Until the last of them has ended; zero when none waits for its pairing.
    std::chrono::milliseconds timeLeft() const {
        std::int64_t left = 0;
        for (const auto& proof : _endOf) left = std::max(left, proof.second - _clock());
        return std::chrono::milliseconds(left);
    }

private:
    Clock _clock;
    std::map<std::pair<platform::UserId, platform::Bytes>, std::int64_t> _endOf;
};

}  // namespace vlm::service
