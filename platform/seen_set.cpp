#include "platform/seen_set.h"

#include <bit>
#include <random>

namespace vlm::platform {

const SeenSet::Secret& SeenSet::secretOfThisProcess() {
    static const Secret secret = [] {
        std::random_device random;
        Secret made{};
        for (auto& part : made) part = (std::uint64_t{random()} << 32U | random()) | 1U;
        return made;
    }();
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
