// Owners of sd-event objects, one per handle type, used by the platform.

#pragma once

#include <systemd/sd-event.h>

#include <memory>

namespace vlm::platform {

struct SdEventUnref {
    void operator()(sd_event* event) const { sd_event_unref(event); }
};
using SdEvent = std::unique_ptr<sd_event, SdEventUnref>;

// A source is off the loop when the handle goes.
struct SdEventSourceRelease {
    void operator()(sd_event_source* source) const { sd_event_source_disable_unref(source); }
};
using SdEventSource = std::unique_ptr<sd_event_source, SdEventSourceRelease>;

}  // namespace vlm::platform
