// BusTokenWatches: tells the programs of a user's session which tokens come and go.
//
// The method Watch answers the tokens that are in, once they are known; from then on the signals
// Inserted and Removed tell the differences, until the caller leaves the bus. The lookout is told
// whether anybody watches, and looks closer then.
//
// Ownership: its parts outlive it; the lookout may be made after it. Threads: the event loop's.
// Blocking:  asks the bus once a call.
// Errors:    another user's program is refused, and so is a watcher too many; the reply is an error
//            of the bus.
// In tests:  tests/integration/service/token_watches_test.cpp, tests/lab/scenarios/watcher.py

#pragma once

#include <systemd/sd-bus.h>

#include <array>
#include <cstddef>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/bus_caller.h"
#include "services/hints/caller.h"
#include "services/hints/token_lookout.h"

namespace vlm::service {

class BusTokenWatches {
public:
    struct Parts {
        sd_bus* bus;
        CallerWatch& callers;
        TokenLookout& lookout;
    };

    static constexpr std::size_t kMostWatchers = 256;
    static constexpr std::size_t kMostWaiting = 512;

    explicit BusTokenWatches(Parts parts);
    BusTokenWatches(const BusTokenWatches&) = delete;
    BusTokenWatches& operator=(const BusTokenWatches&) = delete;

    // Puts the interface on the bus. False when the bus does not take it.
    bool start();

    // What the lookout tells.
    void inserted(const std::string& token) { tell("Inserted", token); }
    void removed(const std::string& token) { tell("Removed", token); }
    void looked();

private:
    static int onWatch(sd_bus_message* call, void* self, sd_bus_error* error);
    int watch(sd_bus_message* call);
    void leave(const std::string& connection);
    void answer(sd_bus_message* call);
    void tell(const char* signal, const std::string& token);

    Parts _parts;
    std::array<sd_bus_vtable, 5> _members;
    std::map<std::string, std::unique_ptr<CallerWatch::Watch>> _watchers;  // by their connections
    std::vector<platform::SdBusMessage> _waiting;                          // for the first look
    bool _isKnown = false;  // what the first look has shown
    platform::SdBusSlot _slot;
    KnownCallers _callers;
};

}  // namespace vlm::service
