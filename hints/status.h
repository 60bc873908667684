// The status numbers that the client of the hints service makes itself. Every other number that its
// functions return is the service's own, passed through as it came; 0 is success.

#pragma once

#include "platform/types.h"

namespace vlm::hints {

using platform::Status;

// The exchange gave no status: the service failed the request, or could not be reached. Also a text
// that cannot be sent, from VLUnlockKeybag().
inline constexpr Status kNoStatus = -1000;

// The first text cannot be sent. Also a missing argument, from VLBindUser(), VLUnbindUser() and
// VLUnlockKeybag().
inline constexpr Status kFirstStringRefused = -1001;

// The second text cannot be sent.
inline constexpr Status kSecondStringRefused = -1002;

// The third text cannot be sent. Also a missing argument, from VLPerformLogin().
inline constexpr Status kThirdStringRefused = -1003;

}  // namespace vlm::hints
