#include "platform/binary_property_list_objects.h"

#include <bit>
#include <limits>

#include "platform/utf.h"

namespace vlm::platform::binary_format {

namespace {

// Takes so many bytes off the front; none when there are fewer.
std::optional<Input> takeFront(Input& input, std::uint64_t count) {
    if (count > input.size()) return std::nullopt;
    const Input front = input.first(static_cast<std::size_t>(count));
    input = input.subspan(front.size());
    return front;
}

std::optional<double> readDouble(Object object) {
    const auto digits = takeFront(object.rest, 8);
    if (!digits) return std::nullopt;
    return std::bit_cast<double>(numberIn(*digits));
}

std::optional<std::string> readAscii(Object object) {
    const auto count = takeCount(object, 1);
    if (!count) return std::nullopt;
    const std::string_view text(reinterpret_cast<const char*>(object.rest.data()), *count);
    if (!isAscii(text)) return std::nullopt;
    return std::string(text);
}

std::optional<std::string> readUtf16(Object object) {
    const auto count = takeCount(object, 2);
    if (!count) return std::nullopt;
    std::u16string units(*count, u'\0');
    for (std::size_t at = 0; at < units.size(); ++at)
        units[at] = static_cast<char16_t>(numberIn(object.rest.subspan(at * 2, 2)));
    return utf16ToUtf8(units);
}

}  // namespace

std::uint64_t numberIn(Input bytes) {
    std::uint64_t number = 0;
    for (const std::uint8_t byte : bytes) number = (number << 8U) | byte;
    return number;
}

std::optional<std::size_t> takeCount(Object& object, std::size_t elementSize) {
    std::uint64_t count = object.lowerHalf;
    if (object.lowerHalf == kLongCount) {
        const auto marker = takeFront(object.rest, 1);
        if (!marker || marker->front() >> 4U != static_cast<unsigned>(Kind::Integer))
            return std::nullopt;
        const unsigned widthExponent = marker->front() & 0xFU;
        if (widthExponent > 3) return std::nullopt;
        const auto digits = takeFront(object.rest, 1U << widthExponent);
        if (!digits) return std::nullopt;
        count = numberIn(*digits);
    }
    if (count > object.rest.size() / elementSize) return std::nullopt;
    return static_cast<std::size_t>(count);
}

std::optional<PropertyList> readConstant(const Object& object) {
    if (object.lowerHalf == kFalse) return PropertyList(false);
    if (object.lowerHalf == kTrue) return PropertyList(true);
    return std::nullopt;  // null and fill bytes are no values
}

// One, two and four bytes are unsigned, eight are signed, and sixteen are signed as well: they are
// there for what lies above the range of eight, and nothing else of them can be held.
std::optional<PropertyList> readInteger(Object object) {
    if (object.lowerHalf > 4) return std::nullopt;
    const auto digits = takeFront(object.rest, 1U << object.lowerHalf);
    if (!digits) return std::nullopt;
    if (digits->size() < 8) return PropertyList(numberIn(*digits));
    const std::uint64_t low = numberIn(digits->last(8));
    const auto asSigned = static_cast<std::int64_t>(low);
    if (digits->size() == 8) return PropertyList(asSigned);
    const std::uint64_t high = numberIn(digits->first(8));
    if (high == 0) return PropertyList(low);
    if (high == std::numeric_limits<std::uint64_t>::max() && asSigned < 0)
        return PropertyList(asSigned);
    return std::nullopt;
}

std::optional<PropertyList> readReal(Object object) {
    if (object.lowerHalf == 3) return readDouble(object);
    const auto digits = takeFront(object.rest, 4);
    if (object.lowerHalf != 2 || !digits) return std::nullopt;
    return PropertyList(
        double{std::bit_cast<float>(static_cast<std::uint32_t>(numberIn(*digits)))});
}

std::optional<PropertyList> readDate(const Object& object) {
    const auto seconds = readDouble(object);
    if (object.lowerHalf != kDateWidth || !seconds) return std::nullopt;
    return PropertyList(PropertyList::Date{*seconds});
}

std::optional<Input> readData(Object object) {
    const auto count = takeCount(object, 1);
    if (!count) return std::nullopt;
    return object.rest.first(*count);
}

std::optional<std::string> readText(const Object& object) {
    if (object.kind == Kind::Ascii) return readAscii(object);
    if (object.kind == Kind::Utf16) return readUtf16(object);
    return std::nullopt;
}

}  // namespace vlm::platform::binary_format
