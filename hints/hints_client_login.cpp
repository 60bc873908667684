// Logging in with a card, and what a login opens.

#include "hints/hints_client.h"
#include "hints/hints_connection.h"
#include "hints/hints_exchange.h"
#include "hints/hints_log.h"
#include "hints/status.h"
#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/token_framework.h"

using namespace vlm::hints;
using vlm::platform::Bytes;
using vlm::platform::ErrorPlace;
using vlm::platform::Status;
using vlm::platform::String;
using vlm::platform::UserId;

Status VLPerformLogin(UserId userId, const std::optional<String>& tokenIdentifier,
                      const std::optional<Bytes>& publicKeyHash,
                      const std::optional<String>& secondString,
                      const std::optional<String>& thirdString, ErrorPlace error) {
    log().debug("VLPerformLogin");
    if (!tokenIdentifier || !publicKeyHash) {
        log().error("VLPerformLogin wrong params");
        return kThirdStringRefused;
    }

    auto request = makeRequest(Operation::PerformLogin);
    request.set("dat1", *publicKeyHash);
    if (!setString(&request, 1, tokenIdentifier, "VLPerformLogin")) return kFirstStringRefused;
    if (secondString && !setString(&request, 2, secondString, "VLPerformLogin"))
        return kSecondStringRefused;
    if (thirdString && !setString(&request, 3, thirdString, "VLPerformLogin"))
        return kThirdStringRefused;

    const auto connection = connectTo(Instance::ByRule);
    setUserId(&request, userOrConsoleUser(userId));
    const auto reply = connection->sendAndWait(request);
    vlm::platform::decodeReplyError(reply, error);
    return readStatus(reply);
}

Status VLUnlockKeybag(UserId userId, const std::optional<String>& text) {
    log().debug("VLUnlockKeybag for {}", userIdNumber(userId));
    if (userId == 0) {
        log().error("VLUnlockKeybag wrong params");
        return kFirstStringRefused;
    }

    auto request = makeRequest(Operation::UnlockKeybag);
    setUserId(&request, userId);
    if (!setString(&request, 1, text, "VLUnlockKeybag")) return kNoStatus;

    const UserId ownUserId = vlm::platform::current().processInfo().realUserId();
    const auto connection = connectTo(userId == ownUserId ? Instance::ByRule : Instance::Daemon);
    return readStatusUnlessFailed(connection->sendAndWait(request));
}
