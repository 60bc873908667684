#include "platform/utf.h"

#include <cstdint>
#include <cstring>

namespace vlm::platform {

namespace {

constexpr char32_t kFirstSupplementary = 0x10000;

// What may follow a lead byte: how many bytes, and the range of the first of them. The narrower
// ranges keep out overlong forms, surrogates and what lies above U+10FFFF.
struct Utf8Lead {
    std::size_t following = 0;
    std::uint8_t lowestSecond = 0x80;
    std::uint8_t highestSecond = 0xBF;
};

std::optional<Utf8Lead> utf8Lead(std::uint8_t byte) {
    if (byte >= 0xC2 && byte <= 0xDF) return Utf8Lead{1};
    if (byte == 0xE0) return Utf8Lead{2, 0xA0, 0xBF};
    if (byte == 0xED) return Utf8Lead{2, 0x80, 0x9F};
    if (byte >= 0xE1 && byte <= 0xEF) return Utf8Lead{2};
    if (byte == 0xF0) return Utf8Lead{3, 0x90, 0xBF};
    if (byte >= 0xF1 && byte <= 0xF3) return Utf8Lead{3};
    if (byte == 0xF4) return Utf8Lead{3, 0x80, 0x8F};
    return std::nullopt;
}

bool isHighSurrogate(char16_t unit) { return unit >= 0xD800 && unit <= 0xDBFF; }
bool isLowSurrogate(char16_t unit) { return unit >= 0xDC00 && unit <= 0xDFFF; }

}  // namespace

TextPiece firstOfUtf8(std::string_view text) {
    const auto byteAt = [&](std::size_t at) { return static_cast<std::uint8_t>(text[at]); };
    const std::uint8_t first = byteAt(0);
    if (first < 0x80) return {char32_t{first}, 1};

    const auto lead = utf8Lead(first);
    if (!lead) return {std::nullopt, 1};
    char32_t character = first & (0x3FU >> lead->following);
    for (std::size_t at = 1; at <= lead->following; ++at) {
        const std::uint8_t lowest = at == 1 ? lead->lowestSecond : std::uint8_t{0x80};
        const std::uint8_t highest = at == 1 ? lead->highestSecond : std::uint8_t{0xBF};
        if (at == text.size() || byteAt(at) < lowest || byteAt(at) > highest)
            return {std::nullopt, at};
        character = (character << 6U) | (byteAt(at) & 0x3FU);
    }
    return {character, lead->following + 1};
}

TextPiece firstOfUtf16(std::u16string_view text) {
    const char16_t first = text[0];
    if (!isHighSurrogate(first) && !isLowSurrogate(first)) return {char32_t{first}, 1};
    if (isLowSurrogate(first) || text.size() < 2 || !isLowSurrogate(text[1]))
        return {std::nullopt, 1};
    const char32_t high = first & 0x3FFU;
    const char32_t low = text[1] & 0x3FFU;
    return {kFirstSupplementary + ((high << 10U) | low), 2};
}

Utf8Character encodeUtf8(char32_t character) {
    const auto lead = [](char32_t bits) { return static_cast<char>(bits); };
    const auto following = [character](unsigned shift) {
        return static_cast<char>(0x80U | ((character >> shift) & 0x3FU));
    };
    if (character < 0x80) return {{lead(character)}, 1};
    if (character < 0x800) return {{lead(0xC0U | (character >> 6U)), following(0)}, 2};
    if (character < kFirstSupplementary)
        return {{lead(0xE0U | (character >> 12U)), following(6), following(0)}, 3};
    return {{lead(0xF0U | (character >> 18U)), following(12), following(6), following(0)}, 4};
}

// Eight at a time, since nearly every text is ASCII and all of it has to be looked at.
bool isAscii(std::string_view text) {
    std::uint64_t all = 0;
    std::uint64_t eight = 0;
    if (text.size() < sizeof eight) {
        for (const char byte : text) all |= static_cast<unsigned char>(byte);
    } else {
        // The last eight may overlap the ones before them.
        const char* const last = text.data() + text.size() - sizeof eight;
        for (const char* place = text.data(); place < last; place += sizeof eight) {
            std::memcpy(&eight, place, sizeof eight);
            all |= eight;
        }
        std::memcpy(&eight, last, sizeof eight);
        all |= eight;
    }
    return (all & 0x8080808080808080U) == 0;
}

std::optional<std::string> utf16ToUtf8(std::u16string_view text) {
    std::string utf8;
    utf8.reserve(text.size());
    while (!text.empty()) {
        const TextPiece piece = firstOfUtf16(text);
        if (!piece.character) return std::nullopt;
        utf8 += encodeUtf8(*piece.character).view();
        text.remove_prefix(piece.units);
    }
    return utf8;
}

std::optional<std::u16string> utf8ToUtf16(std::string_view text) {
    std::u16string utf16;
    utf16.reserve(text.size());
    while (!text.empty()) {
        const TextPiece piece = firstOfUtf8(text);
        if (!piece.character) return std::nullopt;
        if (*piece.character < kFirstSupplementary) {
            utf16 += static_cast<char16_t>(*piece.character);
        } else {
            const char32_t above = *piece.character - kFirstSupplementary;
            utf16 += static_cast<char16_t>(0xD800U | (above >> 10U));
            utf16 += static_cast<char16_t>(0xDC00U | (above & 0x3FFU));
        }
        text.remove_prefix(piece.units);
    }
    return utf16;
}

}  // namespace vlm::platform
