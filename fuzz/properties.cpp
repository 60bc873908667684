#include "fuzz/properties.h"

#include "platform/property_list.h"
#include "platform/token_framework.h"

namespace vlm::fuzz {

using namespace platform;

namespace {

// Few objects, so that a list that blows up does not cost the fuzzer its time.
constexpr PropertyListLimits kLimits = {.objects = 1U << 12U};

// A real or a date that is no number does not equal itself, nor does what holds it.
bool equalsItself(const PropertyList& value) { return value == value; }

}  // namespace

bool propertyListRoundTrips(std::span<const std::uint8_t> data) {
    const auto value = readPropertyList(data, kLimits);
    if (!value) return true;
    if (value->describe().find('\n') != std::string::npos) return false;

    const auto written = writeBinaryPropertyList(*value, kLimits);
    const auto again = written ? readPropertyList(*written, kLimits) : std::nullopt;
    if (!again) return false;
    if (equalsItself(*value) && *again != *value) return false;
    return writeBinaryPropertyList(*again, kLimits) == written;
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
