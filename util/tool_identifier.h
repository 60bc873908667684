#pragma once

#include <string_view>

namespace vlm {

// The tool's name on this platform: of its sandbox profile, and the root of its other names.
inline constexpr std::string_view kToolIdentifier = "org.vlm.vlmbind";

// The notification on which the platform starts the agent, and the agent shows its dialog.
inline constexpr std::string_view kForceBindUi = "org.vlm.vlmbind.force-bind-ui";

// The right to pair, which an administrator has; resources/polkit says who may be asked for it.
inline constexpr std::string_view kAdminRight = "org.vlm.vlmbind.admin";

}  // namespace vlm
