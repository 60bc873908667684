#include "services/pam/pam_transaction.h"

#include <security/pam_ext.h>
#include <syslog.h>

#include <algorithm>
#include <memory>

namespace vlm::pam {

namespace {

constexpr const char* kLogin = "vlm_card_login";

void forgetLogin(pam_handle_t*, void* login, int) { delete static_cast<LoggedIn*>(login); }

}  // namespace

const void* PamTransaction::item(int type) const {
    const void* value = nullptr;
    return pam_get_item(_handle, type, &value) == PAM_SUCCESS ? value : nullptr;
}

std::string PamTransaction::textItem(int type) const {
    const auto* text = static_cast<const char*>(item(type));
    return text ? text : "";
}

Conversation PamTransaction::conversation() const {
    return Conversation(static_cast<const pam_conv*>(item(PAM_CONV)));
}

std::string PamTransaction::user() { return textItem(PAM_USER); }

int PamTransaction::askForUser() {
    const char* name = nullptr;
    const int result = pam_get_user(_handle, &name, nullptr);
    if (result == PAM_CONV_AGAIN) return PAM_INCOMPLETE;
    if (result != PAM_SUCCESS) return PAM_CONV_ERR;
    return name && *name ? PAM_SUCCESS : PAM_USER_UNKNOWN;
}

int PamTransaction::setUser(const std::string& user) {
    return pam_set_item(_handle, PAM_USER, user.c_str());
}

Transaction::Answer PamTransaction::askSecretly(const std::string& prompt) {
    return conversation().askSecretly(prompt);
}

void PamTransaction::tell(int style, const std::string& text) {
    if (!_isSilent) conversation().tell(style, text);
}

void PamTransaction::debug(const std::string& text) {
    if (_isDebugging) pam_syslog(_handle, LOG_DEBUG, "%s", text.c_str());
}

// PAM takes text that ends with a zero, so one that holds a zero would be cut.
int PamTransaction::giveToken(const service::Secret& token) {
    const auto text = token.text();
    if (text.empty() || text.find('\0') != text.npos) return PAM_AUTHTOK_ERR;
    auto ended = service::Secret::ofSize(text.size() + 1);
    std::ranges::copy(text, ended.memory().begin());
    return pam_set_item(_handle, PAM_AUTHTOK, ended.text().data());
}

std::optional<service::Secret> PamTransaction::token() {
    const auto* text = static_cast<const char*>(item(PAM_AUTHTOK));
    if (!text || !*text) return std::nullopt;
    return service::Secret(text);
}

bool PamTransaction::knowsFormerToken() { return item(PAM_OLDAUTHTOK) != nullptr; }

std::string PamTransaction::sessionId() {
    const char* id = pam_getenv(_handle, "XDG_SESSION_ID");
    return id ? id : "";
}

int PamTransaction::remember(const LoggedIn& login) {
    auto kept = std::make_unique<LoggedIn>(login);
    const int result = pam_set_data(_handle, kLogin, kept.get(), forgetLogin);
    if (result == PAM_SUCCESS) static_cast<void>(kept.release());
    return result;
}

void PamTransaction::forget() { pam_set_data(_handle, kLogin, nullptr, nullptr); }

std::optional<LoggedIn> PamTransaction::remembered() {
    const void* login = nullptr;
    if (pam_get_data(_handle, kLogin, &login) != PAM_SUCCESS || !login) return std::nullopt;
    return *static_cast<const LoggedIn*>(login);
}

}  // namespace vlm::pam
