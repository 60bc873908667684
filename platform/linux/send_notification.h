#pragma once

#include <systemd/sd-bus.h>

#include <string>

namespace vlm::platform {

// Queues one notification on a connection to the session bus. The connection has to stay: a bus
// drops what it holds for a program that it is just starting when the sender leaves. Below zero, as
// sd-bus has it, when that cannot be done. In tests: tests/integration/notifications/
// Without a handler nobody waits for what the receiver does with it.
int sendNotification(sd_bus* bus, const std::string& name,
                     sd_bus_message_handler_t onAnswer = nullptr);

}  // namespace vlm::platform
