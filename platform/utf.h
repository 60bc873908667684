// UTF-8 and UTF-16, one character at a time.
//
// Errors: what encodes no character (a lone surrogate; a stray, overlong or missing byte) is an
//         ill-formed piece. Its length is as far as the next character may begin, so that one
//         broken byte never swallows the good text behind it.
// Source: The Unicode Standard, chapter 3.9, table 3-7.

#pragma once

#include <array>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace vlm::platform {

// What stands at the head of a text: a character or an ill-formed piece, and the code units it
// takes.
struct TextPiece {
    std::optional<char32_t> character;
    std::size_t units = 0;
};

// The head of a text that is not empty.
TextPiece firstOfUtf8(std::string_view text);
TextPiece firstOfUtf16(std::u16string_view text);

// One character as UTF-8, of which the first `size` bytes count.
struct Utf8Character {
    std::array<char, 4> bytes = {};
    std::size_t size = 0;

    std::string_view view() const { return {bytes.data(), size}; }
};

Utf8Character encodeUtf8(char32_t character);

bool isAscii(std::string_view text);

// Whole texts; none when any piece is ill formed.
std::optional<std::string> utf16ToUtf8(std::u16string_view text);
std::optional<std::u16string> utf8ToUtf16(std::string_view text);

}  // namespace vlm::platform
