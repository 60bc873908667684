#include "platform/token_framework.h"

#include <limits>

#include "platform/property_list.h"
#include "platform/string.h"

namespace vlm::platform {

namespace {

constexpr std::string_view kErrorEntry = "err";
constexpr std::string_view kDomain = "domain";
constexpr std::string_view kCode = "code";
constexpr std::string_view kDescription = "description";

constexpr std::int32_t kUnreadableErrorCode = -1;

// An error is a number and a few sentences; whatever claims to be more is not worth the memory.
constexpr PropertyListLimits kErrorLimits = {.depth = 8, .objects = 256, .bytes = 64U << 10U};

Error unreadableError() { return {std::string(VLErrorDomain), kUnreadableErrorCode, {}}; }

std::optional<std::int32_t> code(const PropertyList::Dictionary& entry) {
    const auto* value = entry.find(kCode);
    const auto number = value ? value->integer() : std::nullopt;
    using Code = std::numeric_limits<std::int32_t>;
    if (!number || *number < Code::min() || *number > Code::max()) return std::nullopt;
    return static_cast<std::int32_t>(*number);
}

// The domain on the wire is the service's own; towards the caller every failure of an exchange is
// one of the framework.
Error readError(const Bytes* data) {
    const auto list = data ? readPropertyList(*data, kErrorLimits) : std::nullopt;
    const auto* entry = list ? list->dictionary() : nullptr;
    const auto number = entry ? code(*entry) : std::nullopt;
    if (!number) return unreadableError();

    Error error{std::string(VLErrorDomain), *number, {}};
    const auto* description = entry->find(kDescription);
    if (description && description->text()) error.localizedDescription = *description->text();
    return error;
}

}  // namespace

bool decodeReplyError(const Message& reply, ErrorPlace place) {
    if (!reply.contains(kErrorEntry)) return true;
    if (place) *place = readError(reply.bytes(kErrorEntry));
    return false;
}

void encodeReplyError(const Error& error, Message* reply) {
    // Texts may come from a card or a library; what is not UTF-8 in them must not cost the error.
    PropertyList::Dictionary entry = {
        {std::string(kDomain), String(error.domain).utf8()},
        {std::string(kCode), error.code},
    };
    PropertyList::Dictionary whole = entry;
    if (error.localizedDescription)
        whole.append(std::string(kDescription), String(*error.localizedDescription).utf8());

    auto data = writeBinaryPropertyList(whole, kErrorLimits);
    if (!data) data = writeBinaryPropertyList(entry, kErrorLimits);
    // Even an entry without content makes the reply a failed one.
    reply->set(kErrorEntry, data.value_or(Bytes()));
}

}  // namespace vlm::platform
