#pragma once

#include <string>
#include <utility>

#include "services/hints/pin_prompt.h"
#include "services/hints/pinentry.h"
#include "services/hints/pinentry_program.h"

namespace vlm::service {

// Asks on the desktop that this process belongs to.
class DesktopPinPrompt final : public PinPrompt {
public:
    DesktopPinPrompt(sd_event* event, std::string namedPinentry)
        : _event(event), _namedPinentry(std::move(namedPinentry)) {}

    std::unique_ptr<Question> ask(const PinQuestion& question, Answer answer) override {
        return Pinentry::start(_event, pinentryOnDesktop(_namedPinentry), std::nullopt,
                               pinForm(question), std::move(answer));
    }

private:
    sd_event* _event;
    std::string _namedPinentry;
};

}  // namespace vlm::service
