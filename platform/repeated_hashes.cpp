#include "platform/repeated_hashes.h"

#include <vector>

namespace vlm::platform {

namespace {

// Tells which hashes met another one at their bit of a map that is small enough for the caches.
class BitMap {
public:
    explicit BitMap(std::size_t hashes)
        : _bits(kBitsPerHash * hashes), _words(_bits / kBitsPerWord + 1) {}

    void add(std::uint32_t hash) {
        Word& word = _words[bitOf(hash) / kBitsPerWord];
        const std::uint64_t bit = std::uint64_t{1} << bitOf(hash) % kBitsPerWord;
        word.shared |= word.taken & bit;
        word.taken |= bit;
    }

    bool isShared(std::uint32_t hash) const {
        const Word& word = _words[bitOf(hash) / kBitsPerWord];
        return (word.shared >> bitOf(hash) % kBitsPerWord & 1U) != 0;
    }

private:
    // One in sixteen different hashes meets another one.
    static constexpr std::size_t kBitsPerHash = 16;
    static constexpr std::size_t kBitsPerWord = 64;

    struct Word {
        std::uint64_t taken = 0;
        std::uint64_t shared = 0;
    };

    std::uint64_t bitOf(std::uint32_t hash) const { return hash * _bits >> 32U; }

    std::uint64_t _bits;
    std::vector<Word> _words;
};

}  // namespace

std::size_t keepRepeatedHashes(std::span<std::uint32_t> hashes) {
    BitMap map(hashes.size());
    for (const std::uint32_t hash : hashes) map.add(hash);

    std::size_t kept = 0;
    for (std::uint32_t& hash : hashes) {
        if (map.isShared(hash))
            ++kept;
        else
            hash = kNoHash;
    }
    return kept;
}

}  // namespace vlm::platform
