#include "platform/seen_set.h"

#include <bit>

namespace vlm::platform {

SeenSet::SeenSet(std::size_t expected)
    : _slots(std::bit_ceil(expected + expected / 2 + 2)), _mask(_slots.size() - 1) {}

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
