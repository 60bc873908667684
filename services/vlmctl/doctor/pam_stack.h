// The modules that let somebody in, in the order in which a service of PAM asks them.
//
// In tests: tests/unit/vlmctl/doctor/pam_stack_test.cpp

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "services/vlmctl/doctor/machine_files.h"

namespace vlm::control::doctor {

// The names of the service's authentication modules, without folder and ending; what it includes is
// in its place. None for a service that is not configured.
std::optional<std::vector<std::string>> authenticationModules(const MachineFiles& files,
                                                              const std::string& service);

}  // namespace vlm::control::doctor
