// What a property list in the text format is put together from.
//
// Errors: none (false) with the problem noted, for what is not well formed.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "platform/property_list_reading.h"
#include "platform/types.h"

namespace vlm::platform {

class TextPropertyListTokens {
public:
    // Both outlive the tokens.
    TextPropertyListTokens(std::string_view text, FirstProblem& problem)
        : _text(text), _problem(problem) {}

    std::size_t at() const { return _at; }
    bool isAtEnd() const { return _at == _text.size(); }
    bool isNext(char character) const { return !isAtEnd() && _text[_at] == character; }
    bool isQuote() const { return isNext('"') || isNext('\''); }
    bool isText() const;

    // Blanks and comments.
    bool skipBlanks();

    bool take(char character);

    // A quoted text or a bare word; isText() says that there is one.
    std::optional<std::string> takeText();

    // Pairs of hexadecimal digits in angle brackets, the first of which is there.
    std::optional<Bytes> takeData();

private:
    std::optional<std::string> takeQuoted();
    std::optional<char32_t> takeEscape();
    std::optional<char32_t> takeOctal();
    std::optional<char32_t> takeUtf16();
    std::optional<char16_t> takeUtf16Unit();

    std::string_view rest() const { return _text.substr(_at); }

    std::string_view _text;
    std::size_t _at = 0;
    FirstProblem& _problem;
};

}  // namespace vlm::platform
