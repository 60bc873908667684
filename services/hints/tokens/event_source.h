// Callbacks on an sd-event loop. A source belongs to whoever holds it; letting go of it takes the
// callback off the loop, also from within the callback.

#pragma once

#include <systemd/sd-event.h>

#include <chrono>
#include <functional>
#include <memory>

namespace vlm::service {

struct EventSourceRelease {
    void operator()(sd_event_source* source) const { sd_event_source_disable_unref(source); }
};
using EventSource = std::unique_ptr<sd_event_source, EventSourceRelease>;

// Each is null when the loop has no room for it. The first two call once.
EventSource callSoon(sd_event* event, std::function<void()> callback);
EventSource callAfter(sd_event* event, std::chrono::milliseconds delay,
                      std::function<void()> callback);
EventSource callWhenReadable(sd_event* event, int descriptor, std::function<void()> callback);

}  // namespace vlm::service
