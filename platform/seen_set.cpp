#include "platform/seen_set.h"

#include <bit>
#include <chrono>
#include <exception>
#include <random>

namespace vlm::platform {

SeenSet::Secret SeenSet::makeSecret() {
    Secret secret{};
    try {
        std::random_device random;
        for (auto& part : secret) part = (std::uint64_t{random()} << 32U | random()) | 1U;
    } catch (const std::exception&) {
        // Without a source of randomness, what differs from one process to the next has to do.
        const auto place = reinterpret_cast<std::uintptr_t>(&secret);
        const auto now = std::chrono::steady_clock::now().time_since_epoch().count();
        std::mt19937_64 numbers(place ^ static_cast<std::uint64_t>(now));
        for (auto& part : secret) part = numbers() | 1U;
    }
    return secret;
}

const SeenSet::Secret& SeenSet::secretOfThisProcess() {
    static const Secret secret = makeSecret();
    return secret;
}

SeenSet::SeenSet(std::size_t expected)
    : _secret(secretOfThisProcess()),
      _slots(std::bit_ceil(expected + expected / 2 + 2)),
      _mask(_slots.size() - 1) {}

void SeenSet::grow() {
    std::vector<Slot> larger(_slots.size() * 4);
    _mask = larger.size() - 1;
    for (const Slot& slot : _slots) {
        if (slot.number == kFree) continue;
        std::size_t at = slot.hash & _mask;
        while (larger[at].number != kFree) at = (at + 1) & _mask;
        larger[at] = slot;
    }
    _slots = std::move(larger);
}

}  // namespace vlm::platform
