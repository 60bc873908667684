#include "platform/property_list_index.h"

#include <cstring>

namespace vlm::platform {

namespace {

// Odd, and with as many ones as zeros in no pattern.
constexpr std::uint64_t kFactor = 0x9E3779B97F4A7C15U;

std::uint64_t mixed(std::uint64_t hash, std::uint64_t word) {
    hash = (hash ^ word) * kFactor;
    return hash ^ (hash >> 29U);
}

template <typename Word>
std::uint64_t wordAt(std::string_view bytes, std::size_t at) {
    Word word = 0;
    std::memcpy(&word, bytes.data() + at, sizeof word);
    return word;
}

// The last eight bytes or fewer, some of them perhaps more than once.
std::uint64_t lastWord(std::string_view bytes) {
    const std::size_t size = bytes.size();
    if (size >= 8) return wordAt<std::uint64_t>(bytes, size - 8);
    if (size >= 4)
        return wordAt<std::uint32_t>(bytes, 0) << 32U | wordAt<std::uint32_t>(bytes, size - 4);
    if (size == 0) return 0;
    return wordAt<std::uint8_t>(bytes, 0) << 16U | wordAt<std::uint8_t>(bytes, size / 2) << 8U |
           wordAt<std::uint8_t>(bytes, size - 1);
}

std::uint32_t upperHalf(std::uint64_t hash) {
    return static_cast<std::uint32_t>((hash * kFactor) >> 32U);
}

}  // namespace

std::uint32_t hashOf(std::uint64_t number) { return upperHalf(mixed(0, number)); }

std::uint32_t hashOf(std::string_view bytes) {
    std::uint64_t hash = mixed(0, bytes.size());
    for (std::size_t at = 0; at + 8 < bytes.size(); at += 8)
        hash = mixed(hash, wordAt<std::uint64_t>(bytes, at));
    return upperHalf(mixed(hash, lastWord(bytes)));
}

}  // namespace vlm::platform
