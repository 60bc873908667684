#pragma once

#include <string>
#include <utility>

#include "services/hints/password_prompt.h"
#include "services/hints/pinentry.h"
#include "services/hints/pinentry_program.h"

namespace vlm::service {

// Asks on the desktop that this process belongs to.
class DesktopPasswordPrompt final : public PasswordPrompt {
public:
    DesktopPasswordPrompt(sd_event* event, std::string namedPinentry)
        : _event(event), _namedPinentry(std::move(namedPinentry)) {}

    std::unique_ptr<Question> ask(const PasswordQuestion& question, Answer answer) override {
        return Pinentry::start(_event, pinentryOnDesktop(_namedPinentry), std::nullopt,
                               passwordForm(question), std::move(answer));
    }

private:
    sd_event* _event;
    std::string _namedPinentry;
};

}  // namespace vlm::service
