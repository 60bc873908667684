// What a pinentry program shows, in words.
//
// Shapes: text for people; names in it are shortened and made harmless here. Line ends are allowed.
// Threads: values. Errors: none.
// In tests: tests/unit/services/pinentry_dialog_test.cpp

#pragma once

#include <chrono>
#include <cstddef>
#include <string>

#include "services/hints/password_prompt.h"
#include "services/hints/pin_prompt.h"

namespace vlm::service {

struct PinentryForm {
    std::string title;
    std::string warning;  // has to be confirmed before anything is asked; empty for none
    std::string description;
    std::string error;  // what was wrong with the last answer; empty for none
    std::string prompt;
    std::string repeatPrompt;       // for typing it a second time; empty for once
    std::size_t mostBytes = 0;      // of what is typed; 1024 is the most that fits a line
    std::chrono::seconds patience;  // each time that something is asked
};

PinentryForm pinForm(const PinQuestion& question);
PinentryForm passwordForm(const PasswordQuestion& question);

}  // namespace vlm::service
