#pragma once

#include <optional>

#include "services/hints/caller.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"

namespace vlm::service {

// Why the caller may not have this done; none when the caller may. This is the only place that
// decides it: root may do all; everybody else may have done what concerns the own account only.
std::optional<Refusal> refusalFor(const Caller& caller, const Request& request);

// Whether an administrator has to allow it besides.
bool needsAdministrator(const Caller& caller, const Request& request);

}  // namespace vlm::service
