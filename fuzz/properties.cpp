#include "fuzz/properties.h"

#include "platform/property_list_reading.h"
#include "platform/property_list_source.h"
#include "platform/token_framework.h"

namespace vlm::fuzz {

using namespace platform;

namespace {

// Few objects, so that a list that blows up does not cost the fuzzer its time.
constexpr PropertyListLimits kLimits = {.objects = 1U << 12U};

// A real or a date that is no number does not equal itself, nor does what holds it.
bool equalsItself(const PropertyList& value) { return value == value; }

bool isOneLine(const std::string& text) { return text.find('\n') == std::string::npos; }

bool returnsThroughBinary(const PropertyList& value) {
    const auto written = writeBinaryPropertyList(value, kLimits);
    const auto again = written ? readPropertyList(*written, kLimits) : std::nullopt;
    if (!again) return false;
    if (equalsItself(value) && *again != value) return false;
    return writeBinaryPropertyList(*again, kLimits) == written;
}

// Also when XML has no form for it.
bool returnsThroughXml(const PropertyList& value) {
    const auto written = writeXmlPropertyList(value, kLimits);
    if (!written) return true;
    const auto again = readPropertyList(Bytes(written->begin(), written->end()), kLimits);
    if (!again) return false;
    if (equalsItself(value) && *again != value) return false;
    return writeXmlPropertyList(*again, kLimits) == written;
}

bool isSound(const PropertyListReading& reading, std::size_t size) {
    if (!reading.value)
        return reading.problem.ends_with('.') && isOneLine(reading.problem) &&
               reading.offset <= size;
    return reading.problem.empty() && isOneLine(reading.value->describe()) &&
           returnsThroughBinary(*reading.value);
}

template <typename Reader>
bool isSoundText(std::span<const std::uint8_t> data, Reader read) {
    const PropertyListSource source(data);
    const auto reading = read(source.text(), kLimits);
    const auto place = source.placeOf(reading.offset);
    return isSound(reading, source.text().size()) && place.line >= 1 &&
           place.line + place.column <= source.text().size() + 2;
}

}  // namespace

bool binaryPropertyListIsSound(std::span<const std::uint8_t> data) {
    return isSound(readBinaryPropertyList(data, kLimits), data.size());
}

bool xmlPropertyListIsSound(std::span<const std::uint8_t> data) {
    return isSoundText(data, readXmlPropertyList);
}

bool textPropertyListIsSound(std::span<const std::uint8_t> data) {
    return isSoundText(data, readTextPropertyList);
}

bool propertyListRoundTrips(std::span<const std::uint8_t> data) {
    const auto found = examinePropertyList(data, kLimits);
    if (found.value.has_value() != found.problem.empty()) return false;
    if (!found.value) return (found.line == 0) == (found.format == PropertyListFormat::Binary);
    if (found.format == PropertyListFormat::Xml && !writeXmlPropertyList(*found.value, kLimits))
        return false;
    return returnsThroughBinary(*found.value) && returnsThroughXml(*found.value);
}

bool replyErrorIsSound(std::span<const std::uint8_t> data) {
    Message reply;
    reply.set("err", Bytes(data.begin(), data.end()));
    std::optional<Error> error;
    if (decodeReplyError(reply, nullptr) || decodeReplyError(reply, &error)) return false;
    if (!error || error->domain != VLErrorDomain) return false;

    Message sentOn;
    encodeReplyError(*error, &sentOn);
    std::optional<Error> received;
    return !decodeReplyError(sentOn, &received) && received == error;
}

}  // namespace vlm::fuzz
