// How vlmctl ends.

#pragma once

namespace vlm::control {

inline constexpr int kExitSuccess = 0;
inline constexpr int kExitFailure = 1;  // it was not done, or what was checked has problems
inline constexpr int kExitUsage = 2;    // the command line, or a file that cannot be read at all

}  // namespace vlm::control
