// Notifications: names posted to the current user's desktop, on which the platform starts whom they
// concern.
//
// Threads:   any.
// Blocking:  until the message is handed over, never for what its receiver does. One that has to be
//            started is waited for until it can take the message, but not for long.
// Errors:    a post that reaches nobody is told in the log.
// Behind it: platform/linux/session_bus_notifications.h
// In tests:  tests/fakes/fake_notifications.h, tests/integration/notifications/

#pragma once

#include <string_view>

namespace vlm::platform {

class Notifications {
public:
    virtual ~Notifications() = default;

    virtual void post(std::string_view name) = 0;
};

}  // namespace vlm::platform
