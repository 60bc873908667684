// Which format a list is in, and its reading.

#include <algorithm>

#include "platform/property_list_reading.h"
#include "platform/property_list_source.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

// Data in the text format begins with '<' too, but hexadecimal digits follow.
bool looksLikeXml(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(" \t\r\n"), text.size()));
    if (!text.starts_with('<')) return false;
    text.remove_prefix(1);
    if (text.starts_with('?') || text.starts_with('!')) return true;
    const auto isLetter = [](char character) {
        return (character >= 'a' && character <= 'z') || (character >= 'A' && character <= 'Z');
    };
    const auto other = text.find_first_not_of("ABCDEFabcdef");
    return other != std::string_view::npos && isLetter(text[other]);
}

PropertyListFormat formatOf(std::string_view text) {
    return looksLikeXml(text) ? PropertyListFormat::Xml : PropertyListFormat::Text;
}

PropertyListExamination examineBinary(std::span<const std::uint8_t> data,
                                      const PropertyListLimits& limits) {
    auto reading = readBinaryPropertyList(data, limits);
    return {PropertyListFormat::Binary, std::move(reading.value), std::move(reading.problem)};
}

PropertyListReading readSource(const PropertyListSource& source, PropertyListFormat format,
                               const PropertyListLimits& limits) {
    if (!source.isWhole()) return {std::nullopt, source.problem(), source.text().size()};
    return format == PropertyListFormat::Xml ? readXmlPropertyList(source.text(), limits)
                                             : readTextPropertyList(source.text(), limits);
}

PropertyListExamination examineText(std::span<const std::uint8_t> data,
                                    const PropertyListLimits& limits) {
    const PropertyListSource source(data);
    PropertyListExamination found;
    found.format = formatOf(source.text());
    auto reading = readSource(source, found.format, limits);
    found.value = std::move(reading.value);
    if (found.value) return found;

    const auto place = source.placeOf(reading.offset);
    found.problem = std::move(reading.problem);
    found.line = place.line;
    found.column = place.column;
    return found;
}

// Too long to be looked through, even for whether it is text: its head tells what it looks like.
PropertyListExamination refuseAsTooLong(std::span<const std::uint8_t> data,
                                        const PropertyListLimits& limits) {
    constexpr std::size_t kHead = 256;
    PropertyListExamination found;
    found.problem = text("It is longer than {} bytes.", limits.bytes);
    if (isBinaryPropertyList(data)) {
        found.format = PropertyListFormat::Binary;
        return found;
    }
    const PropertyListSource head(data.first(std::min(data.size(), kHead)));
    found.format = formatOf(head.text());
    found.line = found.column = 1;
    return found;
}

}  // namespace

PropertyListExamination examinePropertyList(std::span<const std::uint8_t> data,
                                            const PropertyListLimits& limits) {
    if (data.size() > limits.bytes) return refuseAsTooLong(data, limits);
    return isBinaryPropertyList(data) ? examineBinary(data, limits) : examineText(data, limits);
}

std::optional<PropertyList> readPropertyList(std::span<const std::uint8_t> data,
                                             const PropertyListLimits& limits) {
    return examinePropertyList(data, limits).value;
}

}  // namespace vlm::platform
