#include "services/vlmctl/json.h"

#include "platform/utf.h"
#include "services/vlmctl/shown.h"

namespace vlm::control {

namespace {

void writeUnit(std::string& text, char16_t unit) {
    constexpr std::string_view kDigits = "0123456789abcdef";
    text += "\\u";
    for (int shift = 12; shift >= 0; shift -= 4)
        text += kDigits[(static_cast<unsigned>(unit) >> static_cast<unsigned>(shift)) & 0xFU];
}

// JSON escapes UTF-16 units: a character beyond the first plane takes two.
void writeEscaped(std::string& text, char32_t character) {
    const auto utf16 =
        platform::utf8ToUtf16(platform::encodeUtf8(character).view()).value_or(u"\xFFFD");
    for (const char16_t unit : utf16) writeUnit(text, unit);
}

void writeCharacter(std::string& text, std::string_view utf8, char32_t character) {
    if (character == U'"' || character == U'\\') {
        text += '\\';
        text += utf8;
    } else if (character == U'\n') {
        text += "\\n";
    } else if (character == U'\t') {
        text += "\\t";
    } else if (shown(utf8) != utf8) {
        writeEscaped(text, character);
    } else {
        text += utf8;
    }
}

void writeText(std::string& text, std::string_view utf8) {
    text += '"';
    while (!utf8.empty()) {
        const auto piece = platform::firstOfUtf8(utf8);
        if (piece.character)
            writeCharacter(text, utf8.substr(0, piece.units), *piece.character);
        else
            text += "\xEF\xBF\xBD";
        utf8.remove_prefix(piece.units);
    }
    text += '"';
}

void breakLine(std::string& text, std::size_t depth) {
    text += '\n';
    text.append(depth * 2, ' ');
}

// Writes an array or an object, an element a line.
template <typename Elements, typename Write>
void writeElements(std::string& text, const Elements& elements, std::string_view brackets,
                   std::size_t depth, Write write) {
    text += brackets[0];
    std::string_view separator;
    for (const auto& element : elements) {
        text += separator;
        separator = ",";
        breakLine(text, depth + 1);
        write(element);
    }
    if (!elements.empty()) breakLine(text, depth);
    text += brackets[1];
}

}  // namespace

std::string Json::text() const {
    std::string text;
    write(text, 0);
    return text;
}

void Json::write(std::string& text, std::size_t depth) const {
    if (const auto* truth = std::get_if<bool>(&_value)) {
        text += *truth ? "true" : "false";
    } else if (const auto* number = std::get_if<std::int64_t>(&_value)) {
        text += std::to_string(*number);
    } else if (const auto* utf8 = std::get_if<std::string>(&_value)) {
        writeText(text, *utf8);
    } else if (const auto* array = std::get_if<Array>(&_value)) {
        writeElements(text, *array, "[]", depth,
                      [&](const Json& element) { element.write(text, depth + 1); });
    } else if (const auto* object = std::get_if<Object>(&_value)) {
        writeElements(text, *object, "{}", depth, [&](const Member& member) {
            writeText(text, member.first);
            text += ": ";
            member.second.write(text, depth + 1);
        });
    } else {
        text += "null";
    }
}

}  // namespace vlm::control
