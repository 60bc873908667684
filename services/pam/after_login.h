// What the module does besides authentication: nothing, unless this transaction has logged somebody
// in with a card or changes a password.
//
// Threads: the application's. Blocking: for the service, within the time.
// Errors:  PAM's return values.
// In tests: tests/unit/pam/after_login_test.cpp

#pragma once

#include <chrono>

#include "services/pam/exchange.h"
#include "services/pam/transaction.h"

namespace vlm::pam {

struct AfterLogin {
    Transaction& transaction;
    Exchange exchange;
    std::chrono::seconds patience;

    // Whether the account may be used: the pairing that has let it in must still be there.
    int checkAccount();

    // Tells the service which session the card has opened.
    int openSession();

    // Lets the card open the login keyring with the password that was just set.
    int changePassword();
};

}  // namespace vlm::pam
