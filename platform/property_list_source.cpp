#include "platform/property_list_source.h"

#include <algorithm>

#include "platform/text.h"
#include "platform/utf.h"

namespace vlm::platform {

namespace {

constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";
constexpr std::string_view kBigEndianMark = "\xFE\xFF";
constexpr std::string_view kLittleEndianMark = "\xFF\xFE";

bool isPlain(char byte) {
    const auto code = static_cast<unsigned char>(byte);
    return code >= 0x20 && code < 0x80;
}

std::string_view asCharacters(std::span<const std::uint8_t> data) {
    return {reinterpret_cast<const char*>(data.data()), data.size()};
}

}  // namespace

bool isTextCharacter(char32_t character) {
    if (character < 0x20) return character == U'\t' || character == U'\n' || character == U'\r';
    return character != 0xFFFE && character != 0xFFFF;
}

PropertyListSource::PropertyListSource(std::span<const std::uint8_t> data)
    : _original(asCharacters(data)) {
    if (_original.starts_with(kBigEndianMark)) {
        convert(data.subspan(kBigEndianMark.size()), true);
    } else if (_original.starts_with(kLittleEndianMark)) {
        convert(data.subspan(kLittleEndianMark.size()), false);
    } else if (_original.starts_with(kUtf8Mark)) {
        _original.remove_prefix(kUtf8Mark.size());
    }
    cutWhereItIsNoText();
}

void PropertyListSource::convert(std::span<const std::uint8_t> units, bool isBigEndian) {
    _isConverted = true;
    std::u16string utf16(units.size() / 2, u'\0');
    for (std::size_t at = 0; at < utf16.size(); ++at) {
        const std::uint8_t first = units[2 * at];
        const std::uint8_t second = units[2 * at + 1];
        utf16[at] =
            static_cast<char16_t>(isBigEndian ? first << 8U | second : second << 8U | first);
    }

    _converted.reserve(utf16.size());
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const TextPiece piece = firstOfUtf16(rest);
        if (!piece.character) {
            _problem = "This is half of a UTF-16 surrogate pair, and no character.";
            return;
        }
        _converted += encodeUtf8(*piece.character).view();
        rest.remove_prefix(piece.units);
    }
    if (units.size() % 2 != 0) _problem = "The last UTF-16 character is cut.";
}

// Letters that are plain ASCII are nearly all there is, so they are passed over in a run.
void PropertyListSource::cutWhereItIsNoText() {
    const std::string_view whole = text();
    for (auto rest = whole; !rest.empty();) {
        rest.remove_prefix(
            static_cast<std::size_t>(std::ranges::find_if_not(rest, isPlain) - rest.begin()));
        if (rest.empty()) return;
        const TextPiece piece = firstOfUtf8(rest);
        if (piece.character && isTextCharacter(*piece.character)) {
            rest.remove_prefix(piece.units);
            continue;
        }
        _problem = piece.character
                       ? vlm::platform::text("The character with the code {} is no part of a text.",
                                             std::uint32_t{*piece.character})
                       : "This is not UTF-8.";
        const std::size_t good = whole.size() - rest.size();
        _original = _isConverted ? _original : _original.substr(0, good);
        if (_isConverted) _converted.resize(good);
        return;
    }
}

PropertyListSource::Place PropertyListSource::placeOf(std::size_t offset) const {
    const std::string_view whole = text();
    offset = std::min(offset, whole.size());
    Place place;
    std::size_t lineStart = 0;
    for (std::size_t at = 0; at < offset; ++at) {
        // A carriage return with a line feed behind it is one line break.
        const bool isBreak =
            whole[at] == '\n' || (whole[at] == '\r' && whole.substr(at + 1, 1) != "\n");
        if (!isBreak) continue;
        ++place.line;
        lineStart = at + 1;
    }
    const auto isFirstByte = [](char byte) {
        return (static_cast<unsigned char>(byte) & 0xC0U) != 0x80;
    };
    const std::string_view before = whole.substr(lineStart, offset - lineStart);
    place.column = 1 + static_cast<std::size_t>(std::ranges::count_if(before, isFirstByte));
    return place;
}

}  // namespace vlm::platform
