#include "services/vlmctl/display_width.h"

#include <algorithm>
#include <span>

#include "platform/utf.h"

namespace vlm::control {

namespace {

struct Range {
    char32_t first, last;
};

constexpr Range kCombining[] = {
    {0x0300, 0x036F},    // accents
    {0x0483, 0x0489},    // Cyrillic
    {0x0591, 0x05BD},    // Hebrew
    {0x0610, 0x061A},    // Arabic
    {0x064B, 0x065F},    //
    {0x0E34, 0x0E3A},    // Thai
    {0x0E47, 0x0E4E},    //
    {0x1AB0, 0x1AFF},    // more accents
    {0x1DC0, 0x1DFF},    //
    {0x200B, 0x200D},    // zero-width space and joiners
    {0x20D0, 0x20FF},    // marks for symbols
    {0xFE00, 0xFE0F},    // variation selectors
    {0xFE20, 0xFE2F},    // half marks
    {0xE0100, 0xE01EF},  // more variation selectors
};

constexpr Range kWide[] = {
    {0x1100, 0x115F},    // Hangul letters that begin a syllable
    {0x2E80, 0x303E},    // radicals, punctuation
    {0x3041, 0x33FF},    // kana, letters in circles and squares
    {0x3400, 0x4DBF},    // Han
    {0x4E00, 0x9FFF},    //
    {0xA000, 0xA4CF},    // Yi
    {0xA960, 0xA97F},    // Hangul
    {0xAC00, 0xD7A3},    //
    {0xF900, 0xFAFF},    // Han for compatibility
    {0xFE30, 0xFE6F},    // vertical and small forms
    {0xFF00, 0xFF60},    // full-width Latin
    {0xFFE0, 0xFFE6},    //
    {0x1F300, 0x1F64F},  // emoji
    {0x1F680, 0x1F6FF},  //
    {0x1F900, 0x1F9FF},  //
    {0x20000, 0x3FFFD},  // Han beyond the first plane
};

bool isIn(std::span<const Range> ranges, char32_t character) {
    return std::ranges::any_of(ranges, [&](const Range& range) {
        return range.first <= character && character <= range.last;
    });
}

}  // namespace

std::size_t displayWidth(std::string_view text) {
    std::size_t width = 0;
    while (!text.empty()) {
        const auto piece = platform::firstOfUtf8(text);
        const char32_t character = piece.character.value_or(U'?');
        if (!isIn(kCombining, character)) width += isIn(kWide, character) ? 2 : 1;
        text.remove_prefix(piece.units);
    }
    return width;
}

}  // namespace vlm::control
