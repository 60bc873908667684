// String: text as callers of the exported functions hand it over, stored as UTF-8 or as UTF-16.
//
// Text stored as UTF-8 gives its characters directly. Text stored as UTF-16 has to be converted,
// which needs room and can fail (a lone surrogate is no character).
//
// Threads:  a value; distinct values are independent.
// Errors:   none is thrown; text that is not well formed fails to convert.
// Source:   The Unicode Standard, chapter 3.9 (UTF-8, UTF-16).
// In tests: tests/unit/platform/string_test.cpp

#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <variant>

#include "platform/export.h"

namespace vlm::platform {

class VLM_EXPORT String {
public:
    // UTF-8 storage. The text is taken as it is; whoever sends it on decides about ill-formed text.
    String(std::string utf8) : _storage(std::move(utf8)) {}         // NOLINT: text is text
    String(std::string_view utf8) : _storage(std::string(utf8)) {}  // NOLINT
    String(const char* utf8) : _storage(std::string(utf8)) {}       // NOLINT

    // UTF-16 storage, in the machine's byte order.
    static String fromUtf16(std::u16string utf16);

    // The characters as UTF-8 when they are stored that way; none when they need a conversion.
    std::optional<std::string_view> directUtf8() const;

    // The length in UTF-16 code units.
    std::size_t length() const;

    // The most bytes that `length` UTF-16 units can take as UTF-8, without a terminator.
    static std::size_t maximumUtf8Size(std::size_t length) { return length * 3; }

    // Writes the text as UTF-8 and a terminating zero into `buffer`. False, with the buffer's
    // content unspecified, when text and terminator do not fit or the text is ill formed. So a
    // buffer of maximumUtf8Size() bytes is too small where every unit takes three bytes, and for
    // the empty text.
    bool copyUtf8(std::span<char> buffer) const;

    // The text as UTF-8 for people to read; each ill-formed piece becomes U+FFFD.
    std::string utf8() const;

    // Equal when the text is the same, however it is stored.
    bool operator==(const String& other) const { return utf8() == other.utf8(); }

private:
    explicit String(std::u16string utf16) : _storage(std::move(utf16)) {}

    std::variant<std::string, std::u16string> _storage;
};

}  // namespace vlm::platform
