// PinAsking: what the user's instance answers to AskPin(): it asks the user on the desktop.
//
// In tests: tests/unit/services/pin_asking_test.cpp

#pragma once

#include "services/hints/daemon_errand.h"
#include "services/hints/pin_prompt.h"

namespace vlm::service {

class PinAsking final : public DaemonErrand {
public:
    PinAsking(PinPrompt& prompt, CallerWatch& callers) : DaemonErrand(callers), _prompt(prompt) {}

private:
    Outcome<Work> begin(const Caller& caller, const platform::Message& request,
                        Reply reply) override;

    PinPrompt& _prompt;
};

}  // namespace vlm::service
