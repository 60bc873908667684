// The transaction behind a PAM handle.

#pragma once

#include <security/pam_modules.h>

#include <string>

#include "services/pam/conversation.h"
#include "services/pam/transaction.h"

namespace vlm::pam {

class PamTransaction final : public Transaction {
public:
    // The handle outlives the object. A silent one tells the person nothing.
    PamTransaction(pam_handle_t* handle, bool isSilent, bool isDebugging)
        : _handle(handle), _isSilent(isSilent), _isDebugging(isDebugging) {}

    std::string user() override;
    int askForUser() override;
    int setUser(const std::string& user) override;
    Answer askSecretly(const std::string& prompt) override;
    void inform(const std::string& text) override { tell(PAM_TEXT_INFO, text); }
    void warn(const std::string& text) override { tell(PAM_ERROR_MSG, text); }
    void debug(const std::string& text) override;
    int giveToken(const service::Secret& token) override;
    std::optional<service::Secret> token() override;
    bool knowsFormerToken() override;
    std::string terminal() override { return textItem(PAM_TTY); }
    std::string remoteHost() override { return textItem(PAM_RHOST); }
    std::string sessionId() override;
    int remember(const LoggedIn& login) override;
    void forget() override;
    std::optional<LoggedIn> remembered() override;

private:
    const void* item(int type) const;
    std::string textItem(int type) const;
    Conversation conversation() const;
    void tell(int style, const std::string& text);

    pam_handle_t* _handle;
    const bool _isSilent;
    const bool _isDebugging;
};

}  // namespace vlm::pam
