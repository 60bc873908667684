// Calling a method on a bus and waiting for what comes back, as long as that takes.

#pragma once

#include <chrono>

#include "platform/linux/sd_bus_handles.h"

namespace vlm::platform {

inline constexpr auto kAnyTime = std::chrono::microseconds::max();

// Below zero when the call cannot be made, also because the bus takes no connection in time. Else
// the answer is the service's reply or an error: one of the service or the bus, or sd-bus's own
// when the connection ends or the time is over.
int callAndWait(sd_bus* bus, sd_bus_message* call, std::chrono::microseconds patience,
                SdBusMessage& answer);

}  // namespace vlm::platform
