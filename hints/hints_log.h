#pragma once

#include "platform/system_log.h"

namespace vlm::hints {

// The handle that all exported functions log through.
const platform::Log& log();

}  // namespace vlm::hints
