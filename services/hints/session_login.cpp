#include "services/hints/session_login.h"

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/status.h"

namespace vlm::service {

std::optional<Refusal> SessionLogin::note(const Request& request) const {
    cards.forgetUnless(isThere);
    if (!isThere(request.session))
        return refused(status::kBadRequest, request, "there is no such session.");
    if (const auto problem = cards.record(request.session, request.tokenIdentifier))
        return refused(status::kStoreFailed, request, *problem + ".");
    kLog.notice("session {} of {} was opened with the card {}", request.session,
                platform::harmlessText(request.account),
                platform::harmlessText(request.tokenIdentifier));
    return std::nullopt;
}

}  // namespace vlm::service
