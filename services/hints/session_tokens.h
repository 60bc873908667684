// SessionTokens: what the user's instance does about the tokens that come and go while the session
// lasts: it tells the programs that watch, the desktop's agent, and whoever acts on a removed card.
//
// Ownership: its parts outlive it. Threads: the event loop's.
// Blocking:  as bus_token_watches.h and card_events.h say.
// Errors:    a notification that cannot be sent is one log line.
// In tests:  tests/integration/service/session_tokens_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <functional>
#include <string>

#include "services/hints/bus_token_watches.h"
#include "services/hints/card_events.h"
#include "services/hints/card_removal.h"
#include "services/hints/console_watch.h"
#include "services/hints/daemon_link.h"
#include "services/hints/new_token_notice.h"
#include "services/hints/token_lookout.h"

namespace vlm::service {

class SessionTokens {
public:
    struct Parts {
        sd_event* event;
        sd_bus* bus;
        CallerWatch& callers;
        DaemonLink& daemon;
        std::function<void(const std::string& token)> cardRemoved;  // certainly
    };

    explicit SessionTokens(const Parts& parts);
    SessionTokens(const SessionTokens&) = delete;
    SessionTokens& operator=(const SessionTokens&) = delete;

    // Lets programs watch. False when the bus does not take it.
    bool start() { return _watches.start(); }

private:
    void cardEvent(CardEvent event);

    BusTokenWatches _watches;
    NewTokenNotice _notice;
    CardRemoval _removal;
    TokenLookout _lookout;
    CardEvents _cards;
    ConsoleWatch _console;
};

}  // namespace vlm::service
