#pragma once

namespace vlm {

// What the process ends with: every refusal and every failure of a command is the same to a shell.
inline constexpr int kExitSuccess = 0;
inline constexpr int kExitFailure = 255;

}  // namespace vlm
