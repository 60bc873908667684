#pragma once

#include <optional>

#include "services/hints/caller.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"

namespace vlm::service {

// Why the caller may not have this done; none when the caller may. This is the only place that
// decides it: root may do all; everybody else may ask about the own account only, and may not
// change any pairing.
std::optional<Refusal> refusalFor(const Caller& caller, const Request& request);

}  // namespace vlm::service
