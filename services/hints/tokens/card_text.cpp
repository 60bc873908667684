#include "services/hints/tokens/card_text.h"

#include <cstdint>

namespace vlm::service {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

// Takes one character off the front of the text; the replacement for a piece that is ill formed
// (one byte of it at least is taken).
char32_t takeCharacter(std::string_view& text) {
    const auto byteAt = [&text](std::size_t i) { return static_cast<std::uint8_t>(text[i]); };
    const std::uint8_t first = byteAt(0);
    const std::size_t size = first < 0xE0 ? 2 : first < 0xF0 ? 3 : 4;
    if (first < 0xC2 || first > 0xF4) {  // not the first of several
        text.remove_prefix(1);
        return first < 0x80 ? first : kReplacement;
    }
    char32_t character = first & (0x7FU >> size);
    for (std::size_t i = 1; i < size; ++i) {
        if (i >= text.size() || (byteAt(i) & 0xC0U) != 0x80) {
            text.remove_prefix(i);
            return kReplacement;
        }
        character = (character << 6U) | (byteAt(i) & 0x3FU);
    }
    text.remove_prefix(size);
    constexpr char32_t kSmallest[] = {0, 0, 0x80, 0x800, 0x10000};
    const bool surrogate = character >= 0xD800 && character <= 0xDFFF;
    const bool valid = character >= kSmallest[size] && character <= 0x10FFFF && !surrogate;
    return valid ? character : kReplacement;
}

bool isHarmful(char32_t character) {
    const auto within = [character](char32_t first, char32_t last) {
        return character >= first && character <= last;
    };
    return within(0, 0x1F) || within(0x7F, 0x9F) ||          // controls
           within(0x2028, 0x2029) ||                         // line and paragraph ends
           character == 0x061C || within(0x200E, 0x200F) ||  // direction marks
           within(0x202A, 0x202E) || within(0x2066, 0x2069);
}

void append(std::string& text, char32_t character) {
    const auto add = [&text](char32_t byte) { text += static_cast<char>(byte); };
    if (character < 0x80) {
        add(character);
    } else if (character < 0x800) {
        add(0xC0U | (character >> 6U));
        add(0x80U | (character & 0x3FU));
    } else if (character < 0x10000) {
        add(0xE0U | (character >> 12U));
        add(0x80U | ((character >> 6U) & 0x3FU));
        add(0x80U | (character & 0x3FU));
    } else {
        add(0xF0U | (character >> 18U));
        add(0x80U | ((character >> 12U) & 0x3FU));
        add(0x80U | ((character >> 6U) & 0x3FU));
        add(0x80U | (character & 0x3FU));
    }
}

std::string_view trimmed(std::string_view text) {
    const auto isPadding = [](char c) { return c == ' ' || c == '\0'; };
    while (!text.empty() && isPadding(text.front())) text.remove_prefix(1);
    while (!text.empty() && isPadding(text.back())) text.remove_suffix(1);
    return text;
}

}  // namespace

std::string harmlessText(std::string_view text, std::size_t length) {
    std::string harmless;
    text = trimmed(text);
    for (std::size_t count = 0; count < length && !text.empty(); ++count) {
        const char32_t character = takeCharacter(text);
        append(harmless, isHarmful(character) ? kReplacement : character);
    }
    return harmless;
}

}  // namespace vlm::service
