// Json: a value to be written as JSON (RFC 8259), for programs that read what vlmctl prints.
//
// Shapes:   members keep the order in which they were given.
// Errors:   none: a byte that is no text becomes U+FFFD.
// In tests: tests/unit/vlmctl/json_test.cpp

#pragma once

#include <concepts>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace vlm::control {

class Json {
public:
    using Member = std::pair<std::string, Json>;
    using Array = std::vector<Json>;
    using Object = std::vector<Member>;

    Json() = default;  // null
    template <std::same_as<bool> Boolean>
    Json(Boolean value) : _value(value) {}  // NOLINT: values, as in PropertyList
    template <std::integral Number>
    requires(!std::same_as<Number, bool>) Json(Number value)
        : _value(static_cast<std::int64_t>(value)) {}           // NOLINT
    Json(const char* text) : _value(std::string(text)) {}       // NOLINT
    Json(std::string_view text) : _value(std::string(text)) {}  // NOLINT
    Json(std::string text) : _value(std::move(text)) {}         // NOLINT
    Json(Array array) : _value(std::move(array)) {}             // NOLINT
    Json(Object object) : _value(std::move(object)) {}          // NOLINT

    // The value on as many lines as people like to read, without a line feed at the end. Texts are
    // safe on a terminal: what would act there is written as an escape.
    std::string text() const;

private:
    void write(std::string& text, std::size_t depth) const;

    std::variant<std::monostate, bool, std::int64_t, std::string, Array, Object> _value;
};

}  // namespace vlm::control
