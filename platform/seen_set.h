// SeenSet: which of many pieces of bytes came before. A piece is known by its hash and by a number
// that its owner gives it; the set keeps no bytes.
//
// Threads: a value. Errors: none; numbers are at most kMostPieces.

#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace vlm::platform {

class SeenSet {
public:
    static constexpr std::uint32_t kMostPieces = 0xFFFFFFFE;

    explicit SeenSet(std::size_t expected);

    // The number of a piece in the set with the same bytes; else puts this one in under its number,
    // and answers that. isSame(number) answers whether a piece in the set has the same bytes. The
    // hash is a SecretHash where others choose the pieces.
    template <typename IsSame>
    std::uint32_t findOrAdd(std::uint32_t hash, std::uint32_t number, IsSame isSame) {
        if (3 * _used >= 2 * _slots.size()) grow();
        for (std::size_t at = hash & _mask;; at = (at + 1) & _mask) {
            Slot& slot = _slots[at];
            if (slot.number == kFree) {
                slot = {hash, number};
                ++_used;
                return number;
            }
            if (slot.hash == hash && isSame(slot.number)) return slot.number;
        }
    }

private:
    static constexpr std::uint32_t kFree = 0xFFFFFFFF;
    struct Slot {
        std::uint32_t hash = 0;
        std::uint32_t number = kFree;
    };

    void grow();

    std::vector<Slot> _slots;
    std::size_t _mask = 0;
    std::size_t _used = 0;
};

}  // namespace vlm::platform
