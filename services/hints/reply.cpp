#include "services/hints/reply.h"

#include <string>
#include <utility>

#include "platform/token_framework.h"
#include "services/hints/status.h"

namespace vlm::service {

platform::Message numberReply(std::int64_t number) {
    platform::Message reply;
    reply.set("res", number);
    return reply;
}

platform::Message listReply(const platform::PropertyList& value) {
    auto bytes = platform::writeBinaryPropertyList(value);
    if (!bytes)
        return refusalReply({status::kCardFailed,
                             "The answer is too large to be sent. Take some of the cards out and "
                             "try again."});
    platform::Message reply;
    reply.set("res", std::move(*bytes));
    return reply;
}

platform::Message refusalReply(const Refusal& refusal) {
    auto reply = numberReply(refusal.status);
    platform::encodeReplyError({std::string(platform::VLErrorDomain), refusal.status, refusal.text},
                               &reply);
    return reply;
}

}  // namespace vlm::service
