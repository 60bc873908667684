#include "platform/linux/readable_text.h"

#include "platform/harmless_text.h"
#include "platform/utf.h"

namespace vlm::platform {

namespace {

std::string escaped(char32_t character) {
    if (character == '\n') return "\\n";
    if (character == '\t') return "\\t";
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string escape = character > 0xFF ? "\\u" : "\\x";
    for (int shift = character > 0xFF ? 12 : 4; shift >= 0; shift -= 4)
        escape += kDigits[(character >> static_cast<unsigned>(shift)) & 0xFU];
    return escape;
}

}  // namespace

std::string readable(std::string_view text, std::size_t mostBytes) {
    constexpr char32_t kReplacement = 0xFFFD;
    std::string line;
    while (!text.empty()) {
        const TextPiece piece = firstOfUtf8(text);
        const char32_t character = piece.character.value_or(kReplacement);
        const std::string next = actsInsteadOfShowing(character)
                                     ? escaped(character)
                                     : std::string(encodeUtf8(character).view());
        if (line.size() + next.size() > mostBytes) return line.append(kCutMark);
        line += next;
        text.remove_prefix(piece.units);
    }
    return line;
}

}  // namespace vlm::platform
