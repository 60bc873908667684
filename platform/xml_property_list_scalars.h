// What the reader and the writer of the XML format both know: how its elements hold values.
//
// Errors: none for text that is no such value.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "platform/property_list.h"

namespace vlm::platform::xml_format {

// Decimal or 0x and hexadecimal, with a sign or without, of the signed or the unsigned range.
std::optional<PropertyList> integerIn(std::string_view text);

// As the C locale writes them, and nan, inf and infinity, in letters of either case.
std::optional<double> realIn(std::string_view text);
std::string textOf(double real);

// A second in UTC: 2001-01-01T00:00:00Z. The years are 1 to 9999.
std::optional<PropertyList::Date> dateIn(std::string_view text);
std::optional<std::string> textOf(PropertyList::Date date);

// Base64 of RFC 4648, section 4, with blanks anywhere.
std::optional<Bytes> base64In(std::string_view text);
std::string base64Of(std::span<const std::uint8_t> bytes);

bool isBlank(std::string_view text);

// An element that holds its value as text, and what to say of one that does not.
struct Scalar {
    std::string_view name;
    std::optional<PropertyList> (*read)(std::string_view content);
    const char* problem;
};
const Scalar* scalarNamed(std::string_view element);

// What a reference stands for: "amp", "#38", "#x26". Only those that XML itself has.
std::optional<char32_t> characterOf(std::string_view reference);
bool isEntityName(std::string_view name);

}  // namespace vlm::platform::xml_format
