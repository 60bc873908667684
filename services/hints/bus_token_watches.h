// BusTokenWatches: tells the programs of a user's session which tokens come and go.
//
// The method Watch answers the tokens that are in, once they are known; from then on the signals
// Inserted and Removed tell the differences, until the caller leaves the bus. While nobody watches,
// nobody looks at cards.
//
// Ownership: its parts outlive it. Threads: the event loop's.
// Blocking:  asks the bus once a call.
// Errors:    another user's program is refused, and so is a watcher too many; the reply is an error
// of
//            the bus.
// In tests:  tests/integration/service/token_watches_test.cpp, tests/lab/scenarios/watcher.py

#pragma once

#include <systemd/sd-bus.h>

#include <array>
#include <cstddef>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/caller.h"
#include "services/hints/card_events.h"
#include "services/hints/daemon_link.h"
#include "services/hints/token_lookout.h"

namespace vlm::service {

class BusTokenWatches {
public:
    struct Parts {
        sd_event* event;
        sd_bus* bus;
        CallerWatch& callers;
        DaemonLink& daemon;
    };

    static constexpr std::size_t kMostWatchers = 256;
    static constexpr std::size_t kMostWaiting = 512;

    explicit BusTokenWatches(Parts parts);
    BusTokenWatches(const BusTokenWatches&) = delete;
    BusTokenWatches& operator=(const BusTokenWatches&) = delete;

    // Puts the interface on the bus. False when the bus does not take it.
    bool start();

private:
    // What runs while somebody watches.
    struct Looking {
        TokenLookout lookout;
        CardEvents cards;

        Looking(sd_event* event, TokenLookout::Parts parts)
            : lookout(std::move(parts)), cards(event, [this] { lookout.cardEvent(); }) {}
    };

    static int onWatch(sd_bus_message* call, void* self, sd_bus_error* error);
    int watch(sd_bus_message* call);
    void leave(const std::string& connection);
    void startLooking();
    void answerThoseWhoWait();
    void answer(sd_bus_message* call);
    void tell(const char* signal, const std::string& token);

    Parts _parts;
    std::array<sd_bus_vtable, 5> _members;
    std::map<std::string, std::unique_ptr<CallerWatch::Watch>> _watchers;  // by their connections
    std::vector<platform::SdBusMessage> _waiting;                          // for the first look
    bool _isKnown = false;  // what the first look has shown
    std::optional<Looking> _looking;
    platform::SdBusSlot _slot;
};

}  // namespace vlm::service
