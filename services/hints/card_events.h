// CardEvents: tells when a card or a reader comes or goes, as pcscd knows it.
//
// PC/SC waits in calls that block, so a thread of its own does. While no card moves and pcscd runs,
// nothing wakes it; a pcscd that is not there is looked for after pauses that grow up to half a
// minute.
//
// Ownership: the loop outlives it. It may be destroyed by what it calls.
// Threads:   the event loop's; the handler is called there.
// Blocking:  going takes as long as pcscd needs to hear of it, a second at most.
// Errors:    a machine without pcscd has no card events; the log says so once, as an information.
// In tests:  tests/lab/scenarios/watcher.py

#pragma once

#include <systemd/sd-event.h>

#include <functional>
#include <memory>

#include "services/hints/tokens/event_source.h"

namespace vlm::service {

class CardEvents {
public:
    CardEvents(sd_event* event, std::function<void()> changed);
    ~CardEvents();
    CardEvents(const CardEvents&) = delete;
    CardEvents& operator=(const CardEvents&) = delete;

private:
    class Waiter;

    const std::shared_ptr<Waiter> _waiter;
    EventSource _reported;
};

}  // namespace vlm::service
