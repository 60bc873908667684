#pragma once

#include <string>
#include <vector>

#include "services/hints/caller.h"
#include "services/hints/child_program.h"

namespace vlm::service {

// The pinentry program: the one that was named, else the machine's, looked for in the folders of
// the system and never in the PATH of anybody's environment.
std::string pinentryPath(const std::string& named);

// A pinentry for a caller of the daemon: it runs as the caller. For a caller who is not root its
// environment holds nothing of the daemon's own.
ProgramToRun pinentryFor(const Caller& caller, const std::string& named);

// A pinentry on the desktop that this process belongs to.
ProgramToRun pinentryOnDesktop(const std::string& named);

}  // namespace vlm::service
