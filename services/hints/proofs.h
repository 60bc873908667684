// Proofs: which keys were proved to be on a card, by whom, a short time ago.
//
// A pairing needs the proof of the same user for the same key, and uses it up.
//
// Units:     milliseconds of a clock that never goes back.
// Ownership: what is held goes before it.
// Threads:   one. Errors: none.

#pragma once

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
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

    // The proof for one pairing, or none. Until that is made or given up the proof serves nothing
    // else and does not run out, because a person may be reading. Given up, it counts again for
    // what is left of its minute.
    class Held;
    std::unique_ptr<Held> hold(platform::UserId user, const platform::Bytes& hash);

    // Until the last of them has ended; zero when none waits for its pairing.
    std::chrono::milliseconds timeLeft() const {
        std::int64_t left = 0;
        for (const auto& proof : _endOf) left = std::max(left, proof.second - _clock());
        return std::chrono::milliseconds(left);
    }

private:
    using Key = std::pair<platform::UserId, platform::Bytes>;

    Clock _clock;
    std::map<Key, std::int64_t> _endOf;
};

class Proofs::Held {
public:
    Held(Proofs& proofs, Key key, std::int64_t end)
        : _proofs(proofs), _key(std::move(key)), _end(end) {}
    Held(const Held&) = delete;
    Held& operator=(const Held&) = delete;
    ~Held() {
        if (_isUsedUp) return;
        auto& end = _proofs._endOf[_key];
        end = std::max(end, _end);
    }

    void useUp() { _isUsedUp = true; }

private:
    Proofs& _proofs;
    const Key _key;
    const std::int64_t _end;
    bool _isUsedUp = false;
};

inline std::unique_ptr<Proofs::Held> Proofs::hold(platform::UserId user,
                                                  const platform::Bytes& hash) {
    const auto found = _endOf.find({user, hash});
    if (found == _endOf.end() || _clock() >= found->second) return nullptr;
    const auto proof = *found;
    _endOf.erase(found);
    return std::make_unique<Held>(*this, proof.first, proof.second);
}

}  // namespace vlm::service
