#include "platform/harmless_text.h"

#include <algorithm>

#include "platform/utf.h"

namespace vlm::platform {

namespace {

constexpr char32_t kReplacement = 0xFFFD;

struct Range {
    char32_t first, last;
};

constexpr Range kActing[] = {
    {0x00, 0x1F},      // control characters
    {0x7F, 0x9F},      // delete, and the second set of control characters
    {0x061C, 0x061C},  // Arabic letter mark
    {0x200E, 0x200F},  // left-to-right and right-to-left marks
    {0x2028, 0x202E},  // line and paragraph breaks, embeddings and overrides of direction
    {0x2066, 0x2069},  // isolates
};

}  // namespace

bool actsInsteadOfShowing(char32_t character) {
    return std::ranges::any_of(kActing, [&](const Range& range) {
        return range.first <= character && character <= range.last;
    });
}

std::string harmlessText(std::string_view text, std::size_t most) {
    std::string harmless;
    harmless.reserve(std::min(text.size(), most));
    for (std::size_t characters = 0; !text.empty(); ++characters) {
        if (characters == most) return harmless.append(kCutMark);
        const TextPiece piece = firstOfUtf8(text);
        const bool keep = piece.character && !actsInsteadOfShowing(*piece.character);
        harmless += encodeUtf8(keep ? *piece.character : kReplacement).view();
        text.remove_prefix(piece.units);
    }
    return harmless;
}

}  // namespace vlm::platform
