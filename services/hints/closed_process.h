#pragma once

#include <sys/prctl.h>

namespace vlm::service {

// For a process that PINs pass through: the kernel writes no core of its memory, whatever the
// limits are, and lets no other program of its user look into it. A program that it runs is open
// again.
inline void closeToOthers() { prctl(PR_SET_DUMPABLE, 0); }

}  // namespace vlm::service
