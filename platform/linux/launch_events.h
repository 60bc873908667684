// LaunchEvents: the notifications that the session bus delivers to this program, which it starts
// for them. They are calls of Deliver(s name), see session_bus_notifications.h.
//
// Ownership: the connection is on the loop until this goes.
// Threads:   the loop's only; refusing is for any.
// Blocking:  opening and leaving wait for the bus.
// In tests:  tests/integration/agent/

#pragma once

#include <atomic>
#include <functional>
#include <string>

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/sd_event_handles.h"

namespace vlm::platform {

class LaunchEvents {
public:
    using Handler = std::function<void(const std::string& notification)>;

    explicit LaunchEvents(Handler handler) : _handler(std::move(handler)) {}
    LaunchEvents(const LaunchEvents&) = delete;
    LaunchEvents& operator=(const LaunchEvents&) = delete;

    // Empty, or why nothing can be received. When the session bus goes, the loop ends.
    std::string open(sd_event* event);

    // From here on the handler is not called: whoever posts is told to post again, and reaches the
    // process that the bus starts next.
    void refuse() { _isRefusing = true; }

    // Gives the name back.
    void leave();

private:
    static int onDeliver(sd_bus_message* delivery, void* events, sd_bus_error* error);

    const Handler _handler;
    SdBus _bus;
    std::atomic<bool> _isRefusing = false;
};

}  // namespace vlm::platform
