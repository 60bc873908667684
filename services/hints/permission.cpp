#include "services/hints/permission.h"

#include "platform/accounts.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

bool concernsCaller(const Caller& caller, const Request& request) {
    switch (request.operation) {
        case Operation::Pairings:
        case Operation::IsPaired:
            return platform::current().accounts().userId(request.account) == caller.user;
        default:
            return request.user == platform::kNobody || request.user == caller.user;
    }
}

Refusal notPermitted(const Request& request, std::string_view why) {
    return {status::kNotPermitted, platform::text("{}: {}", describe(request), why)};
}

}  // namespace

std::optional<Refusal> refusalFor(const Caller& caller, const Request& request) {
    if (caller.isRoot()) return std::nullopt;
    if (request.operation == Operation::Pair || request.operation == Operation::Unpair)
        return notPermitted(request,
                            "an administrator has to do this. Ask one, or run the command with "
                            "sudo if you are one.");
    if (!concernsCaller(caller, request))
        return notPermitted(request,
                            "only an administrator may ask about another account. Ask about your "
                            "own, or run the command with sudo if you are one.");
    return std::nullopt;
}

}  // namespace vlm::service
