// PinentryDialog: our side of the conversation with a pinentry program, line by line (the Assuan
// protocol: commands answered by "OK", "ERR number text" or "D data" before them).
//
// Where there is a warning, the person has to say yes to it before anything is asked for. What the
// program says is bounded, and what it says of the secret is wiped.
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
#include "services/hints/pinentry_form.h"

namespace vlm::service {

struct PinentryTerminal {
    std::string path;  // as in /dev/pts/3
    std::string type;  // as in xterm
};

class PinentryDialog {
public:
    // Without a terminal the program asks on a desktop.
    PinentryDialog(const PinentryForm& form, const std::optional<PinentryTerminal>& terminal);
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
    void endWithWhatWasTyped();
    void end(PinAnswer::Outcome outcome, std::string reason = {});
    void endWithError(std::string_view error);

    std::vector<std::string> _commands;
    std::size_t _sent = 0;
    bool _isOver = false;
    bool _isTooLong = false;
    PinAnswer _answer;

    std::array<char, 1024> _typed = {};
    std::size_t _typedSize = 0;
    const std::size_t _mostBytes;
    const bool _asksTwice;
    bool _wasRepeated = false;
};

}  // namespace vlm::service
