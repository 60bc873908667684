// What the line of a PAM configuration says behind the module's name.
//
//   debug             what is asked and answered goes into the log, but no secret
//   timeout=SECONDS   how long the service may take for everything but the card's own work
//   bus=ADDRESS       another bus than the system's, for tests
//
// Errors: a word that is not understood is one log line, and left out.

#pragma once

#include <chrono>
#include <string>
#include <vector>

namespace vlm::pam {

struct Options {
    bool isDebugging = false;
    std::chrono::seconds patience{5};
    std::string bus = "unix:path=/run/dbus/system_bus_socket";
    std::vector<std::string> notUnderstood{};
};

Options readOptions(int count, const char* const* words);

}  // namespace vlm::pam
