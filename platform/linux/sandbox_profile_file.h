// The profile that was installed with the program.
//
// A profile is found from the program's own place only: ../share/vlm/sandbox/NAME.profile from its
// folder. Nothing in the environment can name another one; it would let a caller open the
// confinement.
//
// Threads:  any. Blocking: reads one local file.
// Errors:   the answer says which file, which line and why.
// In tests: tests/integration/sandbox/installed_profile_test.cpp

#pragma once

#include <string_view>
#include <vector>

#include "platform/linux/sandbox_profile.h"

namespace vlm::platform {

// Besides the caller's parameters a profile has $(INSTALL_DIR), the folder above the program's.
SandboxProfileAnswer readInstalledProfile(std::string_view name,
                                          std::vector<SandboxParameter> parameters);

}  // namespace vlm::platform
