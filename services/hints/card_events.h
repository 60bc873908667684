// CardEvents: tells when a card or a reader comes or goes, as pcscd knows it, and when pcscd itself
// does.
//
// PC/SC waits in calls that block, so a thread of its own does. While no card moves, nothing wakes
// it. A pcscd that cannot be reached is tried again a few times, after pauses that grow, and from
// then on when its socket is made anew, or on demand.
//
// Ownership: the loop outlives it. It may be destroyed by what it calls.
// Threads:   the event loop's; the handler is called there.
// Blocking:  going takes as long as pcscd needs to hear of it, a second at most.
// Errors:    a machine without pcscd has no card events; the log says so once, as an information.
// In tests:  tests/lab/scenarios/watcher.py, tests/lab/scenarios/new_token.py

#pragma once

#include <systemd/sd-event.h>

#include <functional>
#include <memory>

#include "services/hints/tokens/event_source.h"

namespace vlm::service {

// What has happened. Cards that come and go with pcscd may have been in their readers all the time.
enum class CardEvent {
    CardMoved,   // or its reader
    CardPulled,  // certainly
    PcscdCame,
    PcscdWent,
};

class CardEvents {
public:
    CardEvents(sd_event* event, std::function<void(CardEvent)> happened);
    ~CardEvents();
    CardEvents(const CardEvents&) = delete;
    CardEvents& operator=(const CardEvents&) = delete;

    // The user has come to the console, or something else has changed that pcscd may go by when it
    // decides whom to serve.
    void tryPcscdAgain();

private:
    class Waiter;

    const std::shared_ptr<Waiter> _waiter;
    EventSource _reported;
};

}  // namespace vlm::service
