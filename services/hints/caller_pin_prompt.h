// CallerPinPrompt: the daemon's way to the person in front of a program.
//
// On the terminal that the program runs on; else on the desktop of its user, through that user's
// instance of this service; else, for root's programs, on the desktop of the user at the console.
// A daemon that has just started waits a moment for that instance. The daemon itself calls into
// nobody's session.
//
// In tests: tests/integration/service/pin_prompt_test.cpp, caller_pin_prompt_test.cpp

#pragma once

#include <systemd/sd-event.h>

#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "services/hints/pin_prompt.h"
#include "services/hints/prompter_registry.h"
#include "services/hints/terminal.h"

namespace vlm::service {

class CallerPinPrompt final : public PinPrompt {
public:
    // A pinentry program that was named by the administrator is run without a terminal too, when
    // there is no other way: it may have ways of its own. Empty: the machine's usual one.
    CallerPinPrompt(sd_event* event, PrompterRegistry& prompters, std::string namedPinentry)
        : _event(event), _prompters(prompters), _namedPinentry(std::move(namedPinentry)) {}

    std::unique_ptr<Question> ask(const PinQuestion& question, Answer answer) override;

    // From now on, because the daemon is about to end. Open questions stay.
    void askNobody() { _isEnding = true; }

private:
    std::unique_ptr<Question> askHere(std::optional<Terminal> terminal, const PinQuestion& question,
                                      Answer answer);
    std::unique_ptr<Question> askElsewhere(std::optional<platform::UserId> user,
                                           const PinQuestion& question, Answer answer);

    sd_event* _event;
    PrompterRegistry& _prompters;
    std::string _namedPinentry;
    bool _isEnding = false;
};

}  // namespace vlm::service
