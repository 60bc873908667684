// Makes this process, and all that it starts, the one of a person at the machine's console, as the
// session manager would publish it. It sees a /run of its own; nothing changes for other programs.
//
// Threads: before any is started.
// Errors:  ends the process when the system does not let that be done.

#pragma once

#include <filesystem>

namespace vlm::bench {

// The folder becomes /run. Run as root, it is a user without rights who sits there, and who owns
// the home folder from now on.
void sitAtConsole(const std::filesystem::path& run, const std::filesystem::path& home);

}  // namespace vlm::bench
