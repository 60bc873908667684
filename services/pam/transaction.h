// Transaction: what the module needs of the PAM transaction that it takes part in.
//
// Ownership: texts are the caller's own. Threads: the one that the application called PAM on.
// Blocking:  a question waits for the person as long as the application lets it.
// Errors:    PAM's return values, where a call can fail.
// Behind it: services/pam/pam_transaction.h
// In tests:  tests/fakes/fake_transaction.h

#pragma once

#include <optional>
#include <string>

#include "platform/types.h"
#include "services/hints/secret.h"

namespace vlm::pam {

// The card that has logged somebody in, for what comes later in the same transaction.
struct LoggedIn {
    std::string user;
    std::string tokenIdentifier;
    platform::Bytes hash;
};

class Transaction {
public:
    struct Answer {
        int result;                           // PAM_SUCCESS when there is a text
        std::optional<service::Secret> text;  // may be empty
    };

    virtual ~Transaction() = default;

    virtual std::string user() = 0;  // empty while nobody is named
    virtual int askForUser() = 0;    // user() has the name then
    virtual int setUser(const std::string& user) = 0;

    virtual Answer askSecretly(const std::string& prompt) = 0;
    virtual void inform(const std::string& text) = 0;
    virtual void warn(const std::string& text) = 0;
    virtual void debug(const std::string& text) = 0;  // into the log, where that is wanted

    // The secret that the modules after this one take for the password.
    virtual int giveToken(const service::Secret& token) = 0;
    virtual std::optional<service::Secret> token() = 0;
    virtual bool knowsFormerToken() = 0;

    virtual std::string terminal() = 0;    // empty where the application names none
    virtual std::string remoteHost() = 0;  // likewise
    virtual std::string sessionId() = 0;   // likewise

    virtual int remember(const LoggedIn& login) = 0;
    virtual void forget() = 0;
    virtual std::optional<LoggedIn> remembered() = 0;
};

}  // namespace vlm::pam
