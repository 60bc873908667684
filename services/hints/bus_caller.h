#pragma once

#include <systemd/sd-bus.h>

#include <optional>

#include "services/hints/caller.h"

namespace vlm::service {

// Who sent the message, as the bus says; none when the sender has left the bus already.
std::optional<Caller> callerOf(sd_bus_message* call);

}  // namespace vlm::service
