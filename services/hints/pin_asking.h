// PinAsking: what the user's instance answers to AskPin(): it asks the user on the desktop, for
// the daemon and for nobody else.
//
// Ownership: its parts outlive it. Threads: the event loop's. Blocking: never.
// Errors:    a refusal. A caller that leaves takes its question along.
// In tests:  tests/unit/services/pin_asking_test.cpp

#pragma once

#include <cstdint>
#include <map>
#include <memory>

#include "services/hints/exchanges.h"
#include "services/hints/pin_prompt.h"

namespace vlm::service {

class PinAsking final : public Exchanges {
public:
    PinAsking(PinPrompt& prompt, CallerWatch& callers) : _prompt(prompt), _callers(callers) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override;

private:
    struct Asked {
        std::unique_ptr<PinPrompt::Question> question;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    PinPrompt& _prompt;
    CallerWatch& _callers;
    std::map<std::uint64_t, Asked> _asked;
    std::uint64_t _last = 0;
};

}  // namespace vlm::service
