// TokenServiceLink: the conversation with the service that knows which tokens are there, on the
// session bus.
//
// It asks for the tokens, which starts the service, and hears of changes from then on. When the
// service or the bus goes, it asks again after a pause that grows up to half a minute, and at once
// when the service is back. While all is well nothing wakes it.
//
// Ownership: the loop outlives it. It may not be destroyed by what it calls.
// Threads:   the event loop's, where everything is called too.
// Blocking:  never.
// Errors:    one log line for each time that the service cannot be reached, and one when it can
// again.

#pragma once

#include <systemd/sd-bus.h>

#include <cstdint>
#include <functional>
#include <set>
#include <string>
#include <utility>

#include "platform/linux/growing_pause.h"
#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/sd_event_handles.h"

namespace vlm::platform {

inline constexpr const char* kTokensService = "org.vlm.token.hints.agent";
inline constexpr const char* kTokensObject = "/org/vlm/token/hints";
inline constexpr const char* kTokensInterface = "org.vlm.token.hints.Tokens";

class TokenServiceLink {
public:
    struct Listener {
        std::function<void(const std::set<std::string>&)> all;  // that are there now
        std::function<void(const std::string&)> inserted;
        std::function<void(const std::string&)> removed;
    };

    TokenServiceLink(sd_event* event, Listener listener)
        : _event(event), _listener(std::move(listener)) {}
    TokenServiceLink(const TokenServiceLink&) = delete;
    TokenServiceLink& operator=(const TokenServiceLink&) = delete;

    void start() { connect(); }

private:
    void connect();
    int openBus();
    int listen();
    int addMatch(const char* rule, sd_bus_message_handler_t handler, SdBusSlot& slot);
    void watch();
    int callWatch();
    void failed(const std::string& why);
    void retry();
    void takeAnswer(sd_bus_message* answer);
    void loseBus();

    static int onWatched(sd_bus_message* answer, void* self, sd_bus_error* error);
    static int onInserted(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onRemoved(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onOwnerChanged(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onDisconnected(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onRetry(sd_event_source* source, std::uint64_t time, void* self);

    sd_event* _event;
    const Listener _listener;
    GrowingPause _pause;
    SdEventSource _retry;
    bool _isFailing = false;  // and the log says so
    bool _isLost = false;     // the bus, which is to be opened anew

    LeavingSdBus _bus;
    SdBusSlot _inserted;
    SdBusSlot _removed;
    SdBusSlot _ownerChanged;
    SdBusSlot _disconnected;
    SdBusSlot _watch;
};

}  // namespace vlm::platform
