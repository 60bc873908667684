// SecretHash: a hash of pieces of bytes with a secret of this process in it, so that whoever makes
// the input cannot choose pieces that all meet in one place.
//
// Shapes:  32 bits, never 0.
// Threads: a value. Errors: none.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <string_view>

namespace vlm::platform {

class SecretHash {
public:
    SecretHash() : _secret(secretOfThisProcess()) {}

    // The size is no part of what the bytes are mixed with: a byte could make up for it, and so
    // pieces that end in zeros could be made to meet without knowing the secret. The last words
    // may overlap what came before; pieces of one size are told apart all the same.
    std::uint32_t operator()(std::span<const std::uint8_t> bytes) const {
        using Word = std::uint64_t;
        constexpr std::size_t kTwoWords = 2 * sizeof(Word);
        const std::uint8_t* begin = bytes.data();
        const std::uint8_t* const end = begin + bytes.size();
        const std::uint64_t last = _secret[2] + 2 * bytes.size();
        std::uint64_t hash = _secret[0];
        if (bytes.size() < sizeof(Word))
            return half(folded(hash ^ shortPiece(begin, bytes.size()), last));
        for (; end - begin > std::ptrdiff_t{kTwoWords}; begin += kTwoWords)
            hash =
                folded(hash ^ wordAt<Word>(begin), _secret[1] ^ wordAt<Word>(begin + sizeof(Word)));
        const std::uint8_t* const first = bytes.size() < kTwoWords ? begin : end - kTwoWords;
        return half(folded(hash ^ wordAt<Word>(first), last ^ wordAt<Word>(end - sizeof(Word))));
    }

    std::uint32_t operator()(std::string_view text) const {
        return (*this)({reinterpret_cast<const std::uint8_t*>(text.data()), text.size()});
    }

private:
    static std::uint32_t half(std::uint64_t hash) {
        const auto lower = static_cast<std::uint32_t>(hash);
        return lower == 0 ? 1 : lower;
    }

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

    using Secret = std::array<std::uint64_t, 3>;
    static Secret makeSecret();
    static const Secret& secretOfThisProcess();

    Secret _secret;
};

}  // namespace vlm::platform
