// PropertyList::describe(): text as it is, bytes as <hexadecimal>, [arrays], {"key": dictionaries}.

#include <algorithm>
#include <array>
#include <charconv>
#include <chrono>
#include <cmath>
#include <utility>

#include "platform/property_list.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

// A control character would break the line, or do worse to a terminal that shows it.
void appendOnOneLine(std::string& line, std::string_view text) {
    constexpr std::string_view kDigits = "0123456789ABCDEF";
    for (const char character : text) {
        const auto code = static_cast<unsigned char>(character);
        if (code >= 0x20 && code != 0x7F) {
            line += character;
            continue;
        }
        line += "\\x";
        line += kDigits[code >> 4U];
        line += kDigits[code & 0xFU];
    }
}

// Inside a collection, text stands in quotes: its commas are its own.
void appendQuoted(std::string& line, std::string_view text) {
    line += '"';
    for (const char character : text) {
        if (character == '"' || character == '\\') line += '\\';
        appendOnOneLine(line, {&character, 1});
    }
    line += '"';
}

std::string shortest(double number) {
    std::array<char, 32> digits = {};
    const auto end = std::to_chars(digits.begin(), digits.end(), number).ptr;
    return {digits.begin(), end};
}

std::string padded(std::int64_t number, std::size_t width) {
    const std::string digits = std::to_string(number);
    return std::string(width - std::min(width, digits.size()), '0') + digits;
}

std::string calendar(PropertyList::Date date) {
    using namespace std::chrono;
    constexpr double kCenturies = 3e10;  // seconds either way that have a four-digit year
    if (!(std::abs(date.secondsSince2001) < kCenturies))
        return shortest(date.secondsSince2001) + " s since 2001";

    const seconds since1970 = sys_days{year{2001} / 1 / 1}.time_since_epoch() +
                              seconds{std::llround(std::floor(date.secondsSince2001))};
    const days wholeDays = floor<days>(since1970);
    const year_month_day day{sys_days{wholeDays}};
    const hh_mm_ss time{since1970 - wholeDays};
    return text("{}-{}-{} {}:{}:{} UTC", padded(int{day.year()}, 4),
                padded(unsigned{day.month()}, 2), padded(unsigned{day.day()}, 2),
                padded(time.hours().count(), 2), padded(time.minutes().count(), 2),
                padded(time.seconds().count(), 2));
}

void append(std::string& line, const PropertyList& value);

void appendArray(std::string& line, const PropertyList::Array& array) {
    std::string_view before = "[";
    for (const auto& each : array) {
        line += std::exchange(before, ", ");
        append(line, each);
    }
    line += array.empty() ? "[]" : "]";
}

void appendDictionary(std::string& line, const PropertyList::Dictionary& dictionary) {
    std::string_view before = "{";
    for (const auto& [key, value] : dictionary) {
        line += std::exchange(before, ", ");
        appendQuoted(line, key);
        line += ": ";
        append(line, value);
    }
    line += dictionary.empty() ? "{}" : "}";
}

// Onto one line throughout: a line made at every level would be copied at every level above it.
void append(std::string& line, const PropertyList& value) {
    if (const auto* text = value.text()) return appendQuoted(line, *text);
    if (const auto* array = value.array()) return appendArray(line, *array);
    if (const auto* dictionary = value.dictionary()) return appendDictionary(line, *dictionary);
    line += value.describe();
}

}  // namespace

std::string PropertyList::describe() const {
    if (const auto value = boolean()) return *value ? "true" : "false";
    if (const auto value = integer()) return std::to_string(*value);
    if (const auto value = unsignedInteger()) return std::to_string(*value);
    if (const auto value = real()) return shortest(*value);
    if (const auto value = date()) return calendar(*value);
    if (const auto* value = bytes()) return toText(*value);

    std::string line;
    if (const auto* value = text()) {
        appendOnOneLine(line, *value);
    } else {
        append(line, *this);
    }
    return line;
}

}  // namespace vlm::platform
