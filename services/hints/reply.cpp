#include "services/hints/reply.h"

#include <string>
#include <utility>

#include "platform/token_framework.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

Refusal tooLarge() {
    return {status::kCardFailed,
            "The answer of the hints service is too large to be sent. If many cards are inserted, "
            "take some out and try again."};
}

}  // namespace

platform::Message numberReply(std::int64_t number) {
    platform::Message reply;
    reply.set("res", number);
    return reply;
}

Outcome<platform::Message> listReply(const platform::PropertyList& value) {
    auto bytes = platform::writeBinaryPropertyList(value);
    if (!bytes) return tooLarge();
    platform::Message reply;
    reply.set("res", std::move(*bytes));
    return reply;
}

Outcome<platform::Message> tokenInfoReply(const platform::PropertyList& record) {
    auto context = platform::writeBinaryPropertyList(record);
    if (!context) return tooLarge();
    return listReply(platform::PropertyList::Dictionary{{"ctx", std::move(*context)}});
}

platform::Message refusalReply(const Refusal& refusal) {
    auto reply = numberReply(refusal.status);
    platform::encodeReplyError({std::string(platform::VLErrorDomain), refusal.status, refusal.text},
                               &reply);
    return reply;
}

}  // namespace vlm::service
