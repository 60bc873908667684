// Notifications on the session bus. A post is a call of Deliver(s name) on the name below, which
// the bus starts a program for when nobody has it.

#pragma once

#include <chrono>

#include "platform/notifications.h"

namespace vlm::platform {

inline constexpr const char* kNotificationsService = "org.vlm.vlmbind";
inline constexpr const char* kNotificationsObject = "/org/vlm/vlmbind";
inline constexpr const char* kNotificationsInterface = "org.vlm.Notifications";
inline constexpr const char* kDeliverMethod = "Deliver";

// The answer of a receiver that is about to end, to who waits for one: the next call reaches
// another process.
inline constexpr const char* kLeavingError = "org.vlm.Notifications.Error.Leaving";

class SessionBusNotifications final : public Notifications {
public:
    // How long the bus may take to answer and a receiver to come to it: a program with windows
    // needs a fraction of a second.
    static constexpr std::chrono::seconds kPatience{10};

    explicit SessionBusNotifications(std::chrono::microseconds patience = kPatience)
        : _patience(patience) {}

    void post(std::string_view name) override;

private:
    const std::chrono::microseconds _patience;
};

}  // namespace vlm::platform
