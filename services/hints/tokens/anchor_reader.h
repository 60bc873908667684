// Reads the anchors that a trust module holds. Used in the worker process only.

#pragma once

#include <optional>
#include <string>

#include "services/hints/tokens/machine_anchors.h"

namespace vlm::service {

// None for a module that cannot be loaded.
std::optional<MachineAnchors> readAnchors(const std::string& modulePath);

}  // namespace vlm::service
