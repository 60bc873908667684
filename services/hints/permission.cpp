#include "services/hints/permission.h"

#include "platform/accounts.h"
#include "platform/platform.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

bool changesPairing(const Request& request) {
    return request.operation == Operation::Pair || request.operation == Operation::Unpair;
}

bool concernsCaller(const Caller& caller, const Request& request) {
    switch (request.operation) {
        case Operation::Pair:
        case Operation::Unpair:
        case Operation::Pairings:
        case Operation::IsPaired:
        case Operation::FindLoginCard:
        case Operation::CardLogin:
        case Operation::EraseUnlockKey:
        case Operation::PasswordChanged:
            return platform::current().accounts().userId(request.account) == caller.user;
        case Operation::SessionLogin:
            return false;
        default:
            return request.user == platform::kNobody || request.user == caller.user;
    }
}

}  // namespace

std::optional<Refusal> refusalFor(const Caller& caller, const Request& request) {
    if (caller.isRoot() || concernsCaller(caller, request)) return std::nullopt;
    return refused(status::kNotPermitted, request,
                   changesPairing(request)
                       ? "only root may do this for another account. Ask an administrator, or run "
                         "the command with sudo if you are one."
                       : "only an administrator may ask about another account. Ask about your own, "
                         "or run the command with sudo if you are one.");
}

bool needsAdministrator(const Caller& caller, const Request& request) {
    return !caller.isRoot() && changesPairing(request);
}

}  // namespace vlm::service
