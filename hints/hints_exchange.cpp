#include "hints/hints_exchange.h"

#include <limits>
#include <string>

#include "hints/hints_connection.h"
#include "hints/hints_log.h"
#include "hints/status.h"
#include "platform/token_framework.h"

namespace vlm::hints {

using platform::Message;
using platform::PropertyList;
using platform::Status;
using platform::UserId;

namespace {

constexpr std::string_view kResult = "res";

}  // namespace

Message makeRequest(Operation operation) {
    Message request;
    request.set("op", static_cast<std::uint64_t>(operation));
    return request;
}

bool setString(Message* request, int ordinal, const std::optional<platform::String>& string,
               std::string_view function) {
    const std::string key = "str" + std::to_string(ordinal);
    if (string && setStringToMsgObject(request, key, *string)) return true;
    log().error("{} problem during string ({}) processing", function, ordinal);
    return false;
}

void setUserId(Message* request, UserId userId) { request->set("uid", userIdNumber(userId)); }

UserId userOrConsoleUser(UserId userId) { return userId == 0 ? getUidForAgent() : userId; }

std::unique_ptr<platform::Connection> connectTo(Instance instance) {
    return setupConnection([](platform::ConnectionEvent) {}, instance == Instance::Daemon);
}

Status readStatus(const Message& reply) {
    const auto number = reply.integer(kResult);
    using Range = std::numeric_limits<Status>;
    if (!number || *number < Range::min() || *number > Range::max()) return kNoStatus;
    return static_cast<Status>(*number);
}

Status readStatusUnlessFailed(const Message& reply) {
    return platform::decodeReplyError(reply, nullptr) ? readStatus(reply) : kNoStatus;
}

std::optional<PropertyList> readPropertyListUnlessFailed(const Message& reply) {
    if (!platform::decodeReplyError(reply, nullptr)) return std::nullopt;
    const auto* data = reply.bytes(kResult);
    if (!data) return std::nullopt;
    log().debug("deserializing result");
    return platform::readPropertyList(*data);
}

}  // namespace vlm::hints
