// Terminal: the terminal that a process was started on.
//
// Blocking: no. Errors: a process without a terminal, and a terminal that is not its user's, is
// none.
// In tests: tests/unit/services/terminal_test.cpp

#pragma once

#include <sys/types.h>
#include <termios.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "platform/linux/file_descriptor.h"
#include "services/hints/caller.h"

namespace vlm::service {

class Terminal {
public:
    // The caller's controlling terminal. It must belong to the caller, unless that is root (whose
    // shell often runs on another user's terminal).
    static std::optional<Terminal> of(const Caller& caller);

    Terminal(Terminal&&) noexcept = default;
    Terminal& operator=(Terminal&&) noexcept = default;

    const std::string& path() const { return _path; }
    std::string type() const;

    // Puts back the settings that the terminal had when this object was made: a program that is
    // killed while it asks for a PIN leaves the terminal without an echo.
    void restore() const;

private:
    Terminal(std::string path, platform::FileDescriptor file, const termios& settings)
        : _path(std::move(path)), _file(std::move(file)), _settings(settings) {}

    std::string _path;
    platform::FileDescriptor _file;
    termios _settings;
};

// The number of the controlling terminal in the text of /proc/PID/stat; 0 for none.
dev_t terminalNumber(std::string_view stat);

// Where a terminal with this number is; none for a kind that nobody sits at.
std::optional<std::string> terminalPath(dev_t number);

}  // namespace vlm::service
