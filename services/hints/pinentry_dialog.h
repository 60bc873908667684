// PinentryDialog: our side of the conversation with a pinentry program, line by line (the Assuan
// protocol: commands answered by "OK", "ERR number text" or "D data" before them).
//
// Before a last try the person is warned, and has to say yes, before the PIN is asked for. What the
// program says is bounded, and what it says of the PIN is wiped.
//
// Threads: one. Errors: an answer with the reason.
// In tests: tests/unit/services/pinentry_dialog_test.cpp

#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "services/hints/pin_prompt.h"

namespace vlm::service {

struct PinentryTerminal {
    std::string path;  // as in /dev/pts/3
    std::string type;  // as in xterm
};

class PinentryDialog {
public:
    // A person who is away is not waited for longer, each time that something is asked.
    static constexpr int kPatienceSeconds = 120;

    // Without a terminal the program asks on a desktop.
    PinentryDialog(const PinQuestion& question, const std::optional<PinentryTerminal>& terminal);
    PinentryDialog(const PinentryDialog&) = delete;
    PinentryDialog& operator=(const PinentryDialog&) = delete;
    ~PinentryDialog();

    // Takes one line of the program's, without its end, and answers what to send, which may be
    // nothing.
    std::string take(std::string_view line);

    // The program ended, or said more than any pinentry says.
    void breakOff(const std::string& reason);

    // Whether the program has said all that counts; the answer is final then.
    bool isOver() const { return _isOver; }
    PinAnswer takeAnswer();

private:
    std::string next();
    void collect(std::string_view data);
    void end(PinAnswer::Outcome outcome, std::string reason = {});
    void endWithError(std::string_view error);

    std::vector<std::string> _commands;
    std::size_t _sent = 0;
    bool _isOver = false;
    bool _isTooLong = false;
    PinAnswer _answer;

    std::array<char, 256> _pin = {};
    std::size_t _pinSize = 0;
};

}  // namespace vlm::service
