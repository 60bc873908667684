#include "services/pam/after_login.h"

#include <security/pam_modules.h>

#include <cstdint>
#include <optional>

#include "platform/property_list.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"
#include "services/pam/login_requests.h"

namespace vlm::pam {

namespace {

using platform::Message;
using service::Operation;

constexpr platform::PropertyListLimits kPairingsLimits = {
    .depth = 4, .objects = 4096, .bytes = std::size_t{1} << 20U};

bool isDone(const std::optional<Message>& reply) {
    return reply && reply->integer("res") == service::status::kSuccess;
}

bool isAmong(const platform::Bytes& hash, const Message& pairings) {
    const auto* bytes = pairings.bytes("res");
    const auto list = bytes ? platform::readPropertyList(*bytes, kPairingsLimits) : std::nullopt;
    const auto* hashes = list ? list->dictionary() : nullptr;
    if (!hashes) return false;
    for (const auto& [number, each] : *hashes)
        if (each.bytes() && *each.bytes() == hash) return true;
    return false;
}

}  // namespace

int AfterLogin::checkAccount() {
    const auto login = transaction.remembered();
    if (!login) return PAM_IGNORE;
    if (transaction.user() != login->user) return PAM_PERM_DENIED;
    auto request = requestOf(Operation::Pairings);
    request.set("num1", std::int64_t{0});
    request.set("str1", login->user);
    const auto reply = exchange(request, patience);
    if (reply && isAmong(login->hash, *reply)) return PAM_SUCCESS;
    transaction.warn("The card is no longer paired with this account.");
    return PAM_PERM_DENIED;
}

int AfterLogin::openSession() {
    const auto login = transaction.remembered();
    const auto session = transaction.sessionId();
    if (!login || session.empty()) return PAM_SUCCESS;
    auto request = requestOf(Operation::SessionLogin);
    request.set("str1", session);
    request.set("str2", login->user);
    request.set("str3", login->tokenIdentifier);
    return isDone(exchange(request, patience)) ? PAM_SUCCESS : PAM_SESSION_ERR;
}

// Where the former password is not known, as when an administrator sets a new one, the keyring
// keeps its own, and so does the card.
int AfterLogin::changePassword() {
    if (!transaction.knowsFormerToken()) return PAM_SUCCESS;
    const auto token = transaction.token();
    const auto pipe = token ? service::pipeHolding(*token) : std::nullopt;
    if (!pipe) return PAM_AUTHTOK_ERR;
    auto request = requestOf(Operation::PasswordChanged);
    request.set("str1", transaction.user());
    request.set("dat1", *pipe);
    if (isDone(exchange(request, patience))) return PAM_SUCCESS;
    transaction.warn(
        "Your card does not know the new password, so the login keyring will ask for it. Pair the "
        "card again to change that.");
    return PAM_AUTHTOK_ERR;
}

}  // namespace vlm::pam
