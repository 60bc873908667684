#include "ui/authorized_pairing.h"

#include <string>

#include "platform/authorization.h"
#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "platform/token_framework.h"
#include "util/bind_utils.h"
#include "util/tool_identifier.h"

namespace vlm {

using platform::current;
using platform::Error;
using platform::kSuccess;
using platform::Status;

namespace {

constexpr std::int32_t kAuthorizationError = -5;

PairingOutcome notAuthorized(Status status) {
    const std::string pattern = current().localization().text("AUTH_ERROR");
    return {BindResult::Failed, Error{std::string(platform::VLErrorDomain), kAuthorizationError,
                                      platform::text(pattern, status)}};
}

// None when the right was granted. The session is gone by then: what follows may take its time.
std::optional<PairingOutcome> refusal() {
    const auto& log = BindUtils::log();
    const auto created = current().authorization().createSession();
    if (!created.session) {
        log.debug("failed to create authorization: {}", created.status);
        return notAuthorized(created.status);
    }
    const Status status =
        created.session->request(kAdminRight, {.interactionAllowed = true, .extendRights = true});
    if (status == kSuccess) return std::nullopt;
    if (status == platform::kAuthorizationCanceled) {
        log.debug("authorization canceled");
        return PairingOutcome{BindResult::Canceled, std::nullopt};
    }
    log.debug("authorization failed: {}", status);
    return notAuthorized(status);
}

}  // namespace

PairingOutcome pairWithAuthorization(BindOperation& operation,
                                     const BindOperation::OptionalHash& publicKeyHash) {
    if (auto refused = refusal()) return *std::move(refused);

    std::optional<Error> error;
    if (operation.pairUser(publicKeyHash, /*requireWrapKey=*/true, &error) != kSuccess)
        return {BindResult::Failed, std::move(error)};

    // The pairing stands in any case, and the person is told in other words than these.
    std::optional<Error> dropped;
    const Status stored = operation.storeUnlockKey(publicKeyHash, &dropped);
    return {BindResult::Succeeded, std::nullopt, /*lacksUnlockKey=*/stored != kSuccess};
}

}  // namespace vlm
