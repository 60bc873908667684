// Conversation: asking and telling the person through the function that the application gave PAM.
//
// An application is a stranger: it may answer with nothing, or with an error and an answer. What it
// answered is wiped here and given back to it, whatever becomes of it.
//
// Threads: the application's. Errors: PAM's return values.
// In tests: tests/unit/pam/conversation_test.cpp, fuzz/pam_properties.h

#pragma once

#include <security/pam_modules.h>

#include <string>

#include "services/pam/transaction.h"

namespace vlm::pam {

class Conversation {
public:
    // Null stands for an application that gave no function.
    explicit Conversation(const pam_conv* application) : _application(application) {}

    // PAM_CONV_ERR when the application failed, PAM_AUTH_ERR when the person gave no answer,
    // PAM_INCOMPLETE when the application is to ask and call again.
    Transaction::Answer askSecretly(const std::string& prompt) const;

    void tell(int style, const std::string& text) const;

private:
    Transaction::Answer hold(int style, const std::string& text) const;

    const pam_conv* _application;
};

}  // namespace vlm::pam
