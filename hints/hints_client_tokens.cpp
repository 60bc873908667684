// The inserted tokens, and the channel that tells of them.

#include <utility>

#include "hints/hints_client.h"
#include "hints/hints_connection.h"
#include "hints/hints_exchange.h"
#include "hints/hints_log.h"
#include "platform/token_framework.h"

using namespace vlm::hints;
using vlm::platform::Endpoint;
using vlm::platform::ErrorPlace;
using vlm::platform::PropertyList;
using vlm::platform::UserId;

std::optional<PropertyList> VLCopyAvailableTokensInfo(
    UserId userId, const std::optional<PropertyList::Dictionary>& query) {
    log().debug("VLCopyAvailableTokensInfo for uid {}", userIdNumber(userId));

    auto request = makeRequest(Operation::CopyAvailableTokensInfo);
    if (query) {
        auto data = vlm::platform::writeBinaryPropertyList(*query);
        if (!data) return std::nullopt;
        request.set("dat1", std::move(*data));
    }

    const auto connection = connectTo(Instance::ByRule);
    setUserId(&request, userOrConsoleUser(userId));
    return readPropertyListUnlessFailed(connection->sendAndWait(request));
}

bool VLCopyTokenEndpoints(UserId userId, std::optional<Endpoint>* first,
                          std::optional<Endpoint>* second, ErrorPlace error) {
    log().debug("VLTokenWatcherEndpoint");

    auto request = makeRequest(Operation::CopyTokenEndpoints);
    const auto connection = connectTo(Instance::Daemon);
    setUserId(&request, userId);
    const auto reply = connection->sendAndWait(request);

    if (!vlm::platform::decodeReplyError(reply, error)) return false;
    if (first) *first = reply.endpoint("dat1");
    if (second) *second = reply.endpoint("dat2");
    return true;
}
