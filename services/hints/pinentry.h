// Pinentry: one run of a pinentry program that asks a person for a PIN or a password.
//
// The answer comes when the program has ended, so that the terminal is the person's again.
//
// Ownership: destroying it ends the program, puts the terminal back and answers nothing.
// Threads:   the event loop's; the answer is called once, never before start() has returned.
// Errors:    a program that cannot be run, says nothing or dies is an answer with the reason.
// In tests:  tests/integration/service/pinentry_test.cpp

#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <memory>
#include <optional>

#include "services/hints/child_program.h"
#include "services/hints/pin_prompt.h"
#include "services/hints/pinentry_dialog.h"
#include "services/hints/terminal.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

class Pinentry final : public PinPrompt::Question {
public:
    // Without a terminal the program asks on a desktop, which it finds in its environment.
    static std::unique_ptr<Pinentry> start(sd_event* event, const ProgramToRun& program,
                                           std::optional<Terminal> terminal,
                                           const PinentryForm& form, PinPrompt::Answer answer);

    Pinentry(const Pinentry&) = delete;
    Pinentry& operator=(const Pinentry&) = delete;
    ~Pinentry() override;

private:
    Pinentry(sd_event* event, std::optional<Terminal> terminal, const PinentryForm& form,
             PinPrompt::Answer answer);

    // Why the program does not run; none when it does.
    std::optional<std::string> run(const ProgramToRun& program);
    void read();
    void takeLines();
    void say(const std::string& text);
    void leave();
    void breakOff(const std::string& reason);
    void finish();

    sd_event* _event;
    const std::chrono::seconds _patience;
    PinentryDialog _dialog;
    PinPrompt::Answer _answer;
    std::optional<Terminal> _terminal;
    std::optional<ChildProgram> _program;

    std::array<char, 2048> _said = {};  // lines that are not complete yet
    std::size_t _saidSize = 0;
    std::size_t _saidInAll = 0;
    bool _hasLeft = false;  // we said good-bye

    EventSource _readable;
    EventSource _time;
};

}  // namespace vlm::service
