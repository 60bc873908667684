#include "platform/text_property_list_tokens.h"

#include <algorithm>

#include "platform/text.h"
#include "platform/utf.h"

namespace vlm::platform {

namespace {

bool isBlank(char character) {
    return character == ' ' || character == '\t' || character == '\n' || character == '\r';
}

bool isWordCharacter(char character) {
    return (character >= '0' && character <= '9') || (character >= 'a' && character <= 'z') ||
           (character >= 'A' && character <= 'Z') ||
           std::string_view("_$+/:.-").find(character) != std::string_view::npos;
}

std::optional<std::uint8_t> hexDigit(char character) {
    if (character >= '0' && character <= '9') return static_cast<std::uint8_t>(character - '0');
    if (character >= 'a' && character <= 'f')
        return static_cast<std::uint8_t>(character - 'a' + 10);
    if (character >= 'A' && character <= 'F')
        return static_cast<std::uint8_t>(character - 'A' + 10);
    return std::nullopt;
}

// The characters with an escape of one letter.
std::optional<char32_t> namedEscape(char letter) {
    constexpr std::string_view kLetters = "abfnrtv\\\"'\n";
    constexpr std::string_view kCharacters = "\a\b\f\n\r\t\v\\\"'\n";
    const auto at = kLetters.find(letter);
    if (at == std::string_view::npos) return std::nullopt;
    return static_cast<unsigned char>(kCharacters[at]);
}

}  // namespace

bool TextPropertyListTokens::isText() const {
    return isQuote() || (!isAtEnd() && isWordCharacter(_text[_at]));
}

bool TextPropertyListTokens::skipBlanks() {
    while (!isAtEnd()) {
        if (isBlank(_text[_at])) {
            ++_at;
        } else if (rest().starts_with("//")) {
            _at = std::min(_text.find_first_of("\r\n", _at), _text.size());
        } else if (rest().starts_with("/*")) {
            const auto end = _text.find("*/", _at + 2);
            if (end == std::string_view::npos) {
                _problem.at(_at, "This comment does not end.");
                return false;
            }
            _at = end + 2;
        } else {
            return true;
        }
    }
    return true;
}

bool TextPropertyListTokens::take(char character) {
    const bool isThere = isNext(character);
    if (isThere) ++_at;
    return isThere;
}

std::optional<std::string> TextPropertyListTokens::takeText() {
    if (isQuote()) return takeQuoted();
    const auto word = rest();
    const auto end = std::ranges::find_if_not(word, isWordCharacter);
    _at += static_cast<std::size_t>(end - word.begin());
    return std::string(word.begin(), end);
}

std::optional<std::string> TextPropertyListTokens::takeQuoted() {
    const std::size_t start = _at;
    const char quote = _text[_at++];
    const char stops[] = {quote, '\\'};
    std::string text;
    while (true) {
        const auto stop = _text.find_first_of(stops, _at, sizeof stops);
        if (stop == std::string_view::npos) return _problem.at(start, "This text does not end.");
        text += _text.substr(_at, stop - _at);
        _at = stop;
        if (take(quote)) return text;
        const auto character = takeEscape();
        if (!character) return std::nullopt;
        text += encodeUtf8(*character).view();
    }
}

std::optional<char32_t> TextPropertyListTokens::takeEscape() {
    const std::size_t start = _at++;
    if (isAtEnd()) return _problem.at(start, "This text does not end.");
    if (isNext('U')) return takeUtf16();
    if (_text[_at] >= '0' && _text[_at] <= '7') return takeOctal();
    if (const auto character = namedEscape(_text[_at])) {
        ++_at;
        return character;
    }
    return _problem.at(start, "There is no such character to a backslash.");
}

// One to three digits.
std::optional<char32_t> TextPropertyListTokens::takeOctal() {
    const std::size_t start = _at;
    char32_t character = 0;
    while (!isAtEnd() && _at < start + 3 && _text[_at] >= '0' && _text[_at] <= '7')
        character = character * 8 + static_cast<char32_t>(_text[_at++] - '0');
    if (character > 0377)
        return _problem.at(start, "The greatest octal number of a character is 377.");
    return character;
}

std::optional<char32_t> TextPropertyListTokens::takeUtf16() {
    const std::size_t start = _at;
    std::u16string units;
    for (bool isHighSurrogate = true; isHighSurrogate && units.size() < 2;) {
        if (!units.empty() && !take('\\')) break;
        const auto unit = takeUtf16Unit();
        if (!unit) return std::nullopt;
        units += *unit;
        isHighSurrogate = *unit >= 0xD800 && *unit <= 0xDBFF;
    }
    const TextPiece piece = firstOfUtf16(units);
    if (!piece.character)
        return _problem.at(start, "This is half of a UTF-16 surrogate pair, and no character.");
    return piece.character;
}

// U and four digits.
std::optional<char16_t> TextPropertyListTokens::takeUtf16Unit() {
    const std::size_t start = _at;
    unsigned unit = 0;
    for (const char character : take('U') ? rest().substr(0, 4) : std::string_view()) {
        const auto digit = hexDigit(character);
        if (!digit) break;
        unit = unit << 4U | *digit;
        ++_at;
    }
    if (_at != start + 5) return _problem.at(start, "\\U takes four hexadecimal digits.");
    return static_cast<char16_t>(unit);
}

std::optional<Bytes> TextPropertyListTokens::takeData() {
    const std::size_t start = _at++;
    Bytes bytes;
    unsigned byte = 0;
    std::size_t digits = 0;
    for (; !isAtEnd(); ++_at) {
        if (isBlank(_text[_at])) continue;
        if (isNext('>')) break;
        const auto digit = hexDigit(_text[_at]);
        if (!digit) return _problem.at(_at, "This is no hexadecimal digit.");
        byte = byte << 4U | *digit;
        if (++digits % 2 == 0) bytes.push_back(static_cast<std::uint8_t>(byte));
    }
    if (!take('>')) return _problem.at(start, "This data does not end.");
    if (digits % 2 != 0) return _problem.at(start, "This data ends with half a byte.");
    return bytes;
}

}  // namespace vlm::platform
