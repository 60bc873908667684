#include "platform/xml_property_list_scalars.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <chrono>
#include <cmath>
#include <limits>

#include "platform/property_list_source.h"
#include "platform/text.h"

namespace vlm::platform::xml_format {

namespace {

constexpr std::string_view kBlanks = " \t\r\n";

std::string_view withoutBlanksAround(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(kBlanks), text.size()));
    return text.substr(0, text.find_last_not_of(kBlanks) + 1);
}

bool takePrefix(std::string_view& text, std::string_view prefix) {
    const bool isThere = text.starts_with(prefix);
    if (isThere) text.remove_prefix(prefix.size());
    return isThere;
}

// All of the text as a number that begins with a digit, not with a sign.
std::optional<std::uint64_t> digitsIn(std::string_view text, int base) {
    std::uint64_t number = 0;
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number, base);
    if (error != std::errc() || stop != end) return std::nullopt;
    return number;
}

std::string lowered(std::string_view text) {
    std::string lower(text);
    for (char& letter : lower)
        if (letter >= 'A' && letter <= 'Z') letter = static_cast<char>(letter - 'A' + 'a');
    return lower;
}

std::string padded(std::int64_t number, std::size_t width) {
    const std::string digits = std::to_string(number);
    return std::string(width - std::min(width, digits.size()), '0') + digits;
}

constexpr std::chrono::sys_days kEpoch = std::chrono::year{2001} / 1 / 1;

constexpr std::string_view kBase64 =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr std::uint8_t kNoBase64 = 0xFF;

constexpr auto kBase64Values = [] {
    std::array<std::uint8_t, 256> values = {};
    values.fill(kNoBase64);
    for (std::size_t value = 0; value < kBase64.size(); ++value)
        values[static_cast<unsigned char>(kBase64[value])] = static_cast<std::uint8_t>(value);
    return values;
}();

// The first so many of the three bytes that four characters stand for.
void appendBytes(Bytes& bytes, std::uint32_t bits, std::size_t count) {
    for (std::size_t at = 0; at < count; ++at)
        bytes.push_back(static_cast<std::uint8_t>(bits >> (16 - 8 * at)));
}

template <bool value>
std::optional<PropertyList> boolean(std::string_view content) {
    return isBlank(content) ? std::optional(PropertyList(value)) : std::nullopt;
}

template <auto read>
std::optional<PropertyList> asList(std::string_view content) {
    return read(content);
}

std::optional<std::string> string(std::string_view content) { return std::string(content); }

constexpr Scalar kScalars[] = {
    {"string", asList<string>, ""},
    {"integer", integerIn, "This is no integer of 64 bits."},
    {"real", asList<realIn>, "This is no real number, or none that can be held."},
    {"true", boolean<true>, "The element \"true\" holds no text."},
    {"false", boolean<false>, "The element \"false\" holds no text."},
    {"date", asList<dateIn>, "This is no date such as 2001-01-31T23:59:59Z."},
    {"data", asList<base64In>, "This is no Base64."},
};

}  // namespace

bool isBlank(std::string_view text) {
    return text.find_first_not_of(kBlanks) == std::string_view::npos;
}

const Scalar* scalarNamed(std::string_view element) {
    const auto found = std::ranges::find(kScalars, element, &Scalar::name);
    return found == std::end(kScalars) ? nullptr : found;
}

std::optional<PropertyList> integerIn(std::string_view text) {
    text = withoutBlanksAround(text);
    const bool isNegative = takePrefix(text, "-");
    if (!isNegative) takePrefix(text, "+");
    const bool isHexadecimal = takePrefix(text, "0x") || takePrefix(text, "0X");
    const auto magnitude = digitsIn(text, isHexadecimal ? 16 : 10);
    if (!magnitude) return std::nullopt;
    if (!isNegative) return PropertyList(*magnitude);

    constexpr std::uint64_t kLeast = std::uint64_t{1} << 63U;
    if (*magnitude > kLeast) return std::nullopt;
    return PropertyList(static_cast<std::int64_t>(0 - *magnitude));
}

std::optional<double> realIn(std::string_view text) {
    text = withoutBlanksAround(text);
    const bool isNegative = takePrefix(text, "-");
    if (!isNegative) takePrefix(text, "+");
    const double sign = isNegative ? -1.0 : 1.0;
    const std::string word = lowered(text);
    if (word == "inf" || word == "infinity") return sign * std::numeric_limits<double>::infinity();
    if (word == "nan") return std::numeric_limits<double>::quiet_NaN();
    if (text.find_first_not_of("0123456789.eE+-") != std::string_view::npos ||
        text.starts_with('-'))
        return std::nullopt;

    double number = 0;
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number);
    if (error != std::errc() || stop != end) return std::nullopt;
    return sign * number;
}

// As short as it can be told from every other one.
std::string textOf(double real) {
    if (std::isnan(real)) return "nan";
    std::array<char, 32> digits = {};
    const auto end = std::to_chars(digits.begin(), digits.end(), real).ptr;
    return {digits.begin(), end};
}

std::optional<PropertyList::Date> dateIn(std::string_view text) {
    using namespace std::chrono;
    constexpr std::string_view kPattern = "0000-00-00T00:00:00Z";
    text = withoutBlanksAround(text);
    const auto isDigit = [](char character) { return character >= '0' && character <= '9'; };
    const auto fits = [&](char wanted, char character) {
        return isDigit(wanted) ? isDigit(character) : wanted == character;
    };
    if (!std::ranges::equal(kPattern, text, fits)) return std::nullopt;

    const auto number = [&](std::size_t at, std::size_t width) {
        return static_cast<int>(digitsIn(text.substr(at, width), 10).value_or(0));
    };
    const year_month_day day{year{number(0, 4)}, month{static_cast<unsigned>(number(5, 2))},
                             std::chrono::day{static_cast<unsigned>(number(8, 2))}};
    const int hour = number(11, 2);
    const int minute = number(14, 2);
    const int second = number(17, 2);
    if (int{day.year()} < 1 || !day.ok() || hour > 23 || minute > 59 || second > 59)
        return std::nullopt;
    const std::chrono::seconds since =
        sys_days{day} - kEpoch + hours{hour} + minutes{minute} + seconds{second};
    return PropertyList::Date{static_cast<double>(since.count())};
}

std::optional<std::string> textOf(PropertyList::Date date) {
    using namespace std::chrono;
    constexpr seconds kFirst = sys_days{year{1} / 1 / 1} - kEpoch;
    constexpr seconds kEnd = sys_days{year{10000} / 1 / 1} - kEpoch;
    const double since = date.secondsSince2001;
    if (!(since >= static_cast<double>(kFirst.count()) &&
          since < static_cast<double>(kEnd.count())))
        return std::nullopt;
    const seconds whole{static_cast<std::int64_t>(since)};
    if (static_cast<double>(whole.count()) != since) return std::nullopt;

    const days wholeDays = floor<days>(whole);
    const year_month_day day{kEpoch + wholeDays};
    const hh_mm_ss time{whole - wholeDays};
    return text("{}-{}-{}T{}:{}:{}Z", padded(int{day.year()}, 4), padded(unsigned{day.month()}, 2),
                padded(unsigned{day.day()}, 2), padded(time.hours().count(), 2),
                padded(time.minutes().count(), 2), padded(time.seconds().count(), 2));
}

// Strict, so that no two texts are the same data but for their blanks: whole groups of four,
// padding only at the end, and no bits in it.
std::optional<Bytes> base64In(std::string_view text) {
    Bytes bytes;
    bytes.reserve(text.size() / 4 * 3);
    std::uint32_t bits = 0;
    std::size_t characters = 0;
    std::size_t padding = 0;
    for (const char character : text) {
        if (kBlanks.find(character) != std::string_view::npos) continue;
        ++characters;
        if (character == '=') {
            ++padding;
            continue;
        }
        const std::uint8_t value = kBase64Values[static_cast<unsigned char>(character)];
        if (value == kNoBase64 || padding > 0) return std::nullopt;
        bits = (bits << 6U | value) & 0xFFFFFFU;
        if (characters % 4 == 0) appendBytes(bytes, bits, 3);
    }
    if (characters % 4 != 0 || padding > 2) return std::nullopt;
    if (padding == 0) return bytes;
    bits = (bits << (6 * padding)) & 0xFFFFFFU;
    if ((bits & ((1U << (8 * padding)) - 1)) != 0) return std::nullopt;
    appendBytes(bytes, bits, 3 - padding);
    return bytes;
}

std::string base64Of(std::span<const std::uint8_t> bytes) {
    std::string text;
    text.reserve((bytes.size() + 2) / 3 * 4);
    for (; !bytes.empty(); bytes = bytes.subspan(std::min<std::size_t>(3, bytes.size()))) {
        std::uint32_t bits = 0;
        for (std::size_t at = 0; at < 3; ++at)
            bits = bits << 8U | (at < bytes.size() ? bytes[at] : 0U);
        for (std::size_t at = 0; at < 4; ++at)
            text += at <= bytes.size() ? kBase64[(bits >> (18 - 6 * at)) & 0x3FU] : '=';
    }
    return text;
}

std::optional<char32_t> characterOf(std::string_view reference) {
    constexpr std::pair<std::string_view, char32_t> kNamed[] = {
        {"amp", U'&'}, {"lt", U'<'}, {"gt", U'>'}, {"quot", U'"'}, {"apos", U'\''}};
    const auto named =
        std::ranges::find(kNamed, reference, [](const auto& each) { return each.first; });
    if (named != std::end(kNamed)) return named->second;

    if (!takePrefix(reference, "#")) return std::nullopt;
    const bool isHexadecimal = takePrefix(reference, "x");
    const auto code = digitsIn(reference, isHexadecimal ? 16 : 10);
    if (!code || *code > 0x10FFFF || (*code >= 0xD800 && *code <= 0xDFFF)) return std::nullopt;
    const auto character = static_cast<char32_t>(*code);
    return isTextCharacter(character) ? std::optional(character) : std::nullopt;
}

// Enough of the rule to tell a name from an '&' that was left as it is.
bool isEntityName(std::string_view name) {
    const auto isPart = [](char character) {
        const auto code = static_cast<unsigned char>(character);
        return code > ' ' && std::string_view("&<>\"'#").find(character) == std::string_view::npos;
    };
    return !name.empty() && std::ranges::all_of(name, isPart);
}

}  // namespace vlm::platform::xml_format
