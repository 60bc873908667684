// Authentication: one login with a card, from the search for it to PAM's return value.
//
// What may be done is decided by the service; here is only what a person is asked and told, and
// what each answer means to the other modules. docs/login.md has the table. No error is passed over
// as if nothing had been, and nobody is let in without the service's own word.
//
// Threads: the application's. Blocking: for the person, the service and the card.
// Errors:  PAM's return values.
// In tests: tests/unit/pam/authentication_test.cpp

#pragma once

#include <chrono>
#include <functional>
#include <string>

#include "services/pam/exchange.h"
#include "services/pam/login_requests.h"
#include "services/pam/transaction.h"

namespace vlm::pam {

class Authentication {
public:
    // A person may be looking for the keys of the reader's pad.
    static constexpr std::chrono::seconds kCardPatience{90};

    struct Parts {
        Transaction& transaction;
        Exchange exchange;
        std::chrono::seconds patience;
        // Whether the account may log in with a card only, when the service does not say.
        std::function<bool(const std::string& account)> requiresCard;
    };

    explicit Authentication(Parts parts) : _parts(std::move(parts)) {}

    int run();

private:
    int logInNobodyInParticular();
    int logIn(const std::string& account);
    int logInFromAfar(const std::string& account);
    int askAndLogInFromAfar();
    int logInWith(const std::string& account, const FoundCard& card);
    int prove(const std::string& account, const FoundCard& card, const service::Secret* pin);
    int letIn(const std::string& account, const FoundCard& card, const LoginAnswer& answer);
    int withoutCard(const std::string& account, const Found& found);
    int refuseForWantOfCard(const std::string& account, int result, const std::string& why);
    int usePassword(const std::string& account, const FoundCard& card);
    Found search(const std::string& account);
    int askForPin(const FoundCard& card, service::Secret& pin);

    Transaction& transaction() { return _parts.transaction; }

    const Parts _parts;
};

}  // namespace vlm::pam
