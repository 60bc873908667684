// text(): one line out of a pattern and values, for log lines and messages.
//
// Each "{}" of the pattern takes the next value. Values print as people expect them in a log:
// text as it is, whole numbers in decimal, booleans as 1 and 0, bytes as <hexadecimal>, errors by
// domain, code and description, an absent value as (null).
//
// Threads: any. Errors: a pattern with too few values keeps its "{}"; spare values are dropped.

#pragma once

#include <concepts>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "platform/property_list.h"
#include "platform/string.h"
#include "platform/types.h"

namespace vlm::platform {

// Two upper-case digits a byte with nothing between them.
std::string hexadecimal(const Bytes& bytes);

std::string toText(const Bytes& bytes);
std::string toText(const Error& error);
inline std::string toText(std::string_view text) { return std::string(text); }
inline std::string toText(const char* text) { return text; }
inline std::string toText(const std::string& text) { return text; }
inline std::string toText(const String& text) { return text.utf8(); }
inline std::string toText(const PropertyList& value) { return value.describe(); }

// A template, so that nothing but a boolean is taken for one: a pointer would be, silently.
template <std::integral Number>
std::string toText(Number number) {
    if constexpr (std::same_as<Number, bool>) return number ? "1" : "0";
    return std::to_string(number);
}

template <typename Value>
std::string toText(const std::optional<Value>& value) {
    return value ? toText(*value) : "(null)";
}

std::string fillIn(std::string_view pattern, std::initializer_list<std::string> values);

template <typename... Values>
std::string text(std::string_view pattern, const Values&... values) {
    return fillIn(pattern, {toText(values)...});
}

}  // namespace vlm::platform
