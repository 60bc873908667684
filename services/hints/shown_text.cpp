#include "services/hints/shown_text.h"

#include "platform/utf.h"

namespace vlm::service {

namespace {

constexpr std::string_view kReplacement = "\xEF\xBF\xBD";

bool actsOnATerminal(char32_t character) {
    return character < 0x20 || (character >= 0x7F && character < 0xA0) || character == 0x061C ||
           (character >= 0x200E && character <= 0x200F) ||
           (character >= 0x2028 && character <= 0x202E) ||
           (character >= 0x2066 && character <= 0x2069);
}

}  // namespace

std::string shownText(std::string_view text, std::size_t most) {
    std::string shown;
    for (std::size_t characters = 0; !text.empty(); ++characters) {
        if (characters == most) return shown + "...";
        const auto piece = platform::firstOfUtf8(text);
        const bool harmless = piece.character && !actsOnATerminal(*piece.character);
        shown += harmless ? text.substr(0, piece.units) : kReplacement;
        text.remove_prefix(piece.units);
    }
    return shown;
}

std::string shownHash(const platform::Bytes& hash) {
    constexpr std::string_view kDigits = "0123456789ABCDEF";
    std::string shown;
    for (const auto byte : hash) {
        shown += kDigits[byte >> 4U];
        shown += kDigits[byte & 0xFU];
    }
    return shown;
}

}  // namespace vlm::service
