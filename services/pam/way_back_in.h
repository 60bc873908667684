// The way back in: whoever is root at the machine's own console may always use the password,
// whatever the settings ask for, and whether or not the service for smart cards works. Who mends
// the machine must not be locked out by it.
//
// The console is a virtual terminal of the kernel (tty1 and so on) or "console", and no login from
// afar. A screen of X or Wayland is none: its login programs name no such terminal.

#pragma once

#include <string>

namespace vlm::pam {

bool isRootAtConsole(const std::string& user, const std::string& terminal,
                     const std::string& remoteHost);

}  // namespace vlm::pam
