// SeenSet: which of many pieces of bytes came before. A piece is known by a number that its owner
// gives it; the set keeps no bytes.
//
// Pieces are told apart by a hash with a secret of this process in it, so that whoever makes the
// input cannot choose pieces that all meet in one place.
//
// Threads: a value. Errors: none; numbers are at most kMostPieces.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <vector>

namespace vlm::platform {

class SeenSet {
public:
    static constexpr std::uint32_t kMostPieces = 0xFFFFFFFE;

    explicit SeenSet(std::size_t expected);

    // The number of a piece in the set with the same bytes; else puts this one in under its number,
    // and answers that. isSame(number) answers whether a piece in the set has the same bytes.
    template <typename IsSame>
    std::uint32_t findOrAdd(std::span<const std::uint8_t> bytes, std::uint32_t number,
                            IsSame isSame) {
        if (3 * _used >= 2 * _slots.size()) grow();
        const auto hash = static_cast<std::uint32_t>(hashOf(bytes));
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

    // Both halves of the product, folded into one: every bit of the input reaches every bit of it.
    static std::uint64_t folded(std::uint64_t left, std::uint64_t right) {
        __extension__ using Wide = unsigned __int128;
        const Wide product = Wide{left} * right;
        return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64U);
    }

    template <typename Word>
    static std::uint64_t wordAt(const std::uint8_t* place) {
        Word word = 0;
        std::memcpy(&word, place, sizeof word);
        return word;
    }

    // All bytes of a piece of less than eight; those in the middle may be in it twice.
    static std::uint64_t shortPiece(const std::uint8_t* begin, std::size_t size) {
        if (size == 0) return 0;
        if (size >= 4)
            return wordAt<std::uint32_t>(begin) << 32U | wordAt<std::uint32_t>(begin + size - 4);
        return std::uint64_t{begin[0]} << 16U | std::uint64_t{begin[size / 2]} << 8U |
               begin[size - 1];
    }

    // The size is no part of what the bytes are mixed with: a byte could make up for it, and so
    // pieces that end in zeros could be made to meet without knowing the secret. The last words
    // may overlap what came before; pieces of one size are told apart all the same.
    std::uint64_t hashOf(std::span<const std::uint8_t> bytes) const {
        using Word = std::uint64_t;
        constexpr std::size_t kTwoWords = 2 * sizeof(Word);
        const std::uint8_t* begin = bytes.data();
        const std::uint8_t* const end = begin + bytes.size();
        const std::uint64_t last = _secret[2] + 2 * bytes.size();
        std::uint64_t hash = _secret[0];
        if (bytes.size() < sizeof(Word))
            return folded(hash ^ shortPiece(begin, bytes.size()), last);
        for (; end - begin > std::ptrdiff_t{kTwoWords}; begin += kTwoWords)
            hash =
                folded(hash ^ wordAt<Word>(begin), _secret[1] ^ wordAt<Word>(begin + sizeof(Word)));
        const std::uint8_t* const first = bytes.size() < kTwoWords ? begin : end - kTwoWords;
        return folded(hash ^ wordAt<Word>(first), last ^ wordAt<Word>(end - sizeof(Word)));
    }

    void grow();

    using Secret = std::array<std::uint64_t, 3>;
    static Secret makeSecret();
    static const Secret& secretOfThisProcess();

    Secret _secret;
    std::vector<Slot> _slots;
    std::size_t _mask = 0;
    std::size_t _used = 0;
};

}  // namespace vlm::platform
