#pragma once

#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::service {

// The service's log. What a person must not read in it, a PIN for one, is given to no line.
inline constexpr platform::Log kLog(platform::kTokenFramework, "hints");

}  // namespace vlm::service
