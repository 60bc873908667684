// PasswordPrompt: asks a person for the password of the login keyring, on that person's desktop.
//
// Ownership, threads, blocking and errors are those of pin_prompt.h.
// Behind it: services/hints/desktop_password_prompt.h
// In tests:  tests/fakes/fake_password_prompt.h

#pragma once

#include <memory>
#include <string>

#include "services/hints/pin_prompt.h"

namespace vlm::service {

struct PasswordQuestion {
    std::string card;  // names as people know them
    std::string account;
    bool wasRefused = false;    // what was given before did not open the keyring
    bool isTypedTwice = false;  // because nothing here can check it
};

class PasswordPrompt {
public:
    using Question = PinPrompt::Question;
    using Answer = PinPrompt::Answer;

    virtual ~PasswordPrompt() = default;

    virtual std::unique_ptr<Question> ask(const PasswordQuestion& question, Answer answer) = 0;
};

}  // namespace vlm::service
