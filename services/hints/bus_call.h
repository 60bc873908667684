// BusCall: one method call, `a{sv}` in and `a{sv}` out, on a system-bus connection of its own.
//
// The other side sees its caller leave the bus when the call is given up, as it does for every
// caller, and needs no other sign to stop what it does for it. There is no time-out: a person may
// be typing.
//
// Ownership: the event loop outlives it; destroying it gives the call up, and nothing is answered.
// Threads:   the event loop's; the answer is called there once, never before the constructor ends.
// Errors:    kUnreachable; its text is the end of a sentence that says why.

#pragma once

#include <systemd/sd-bus.h>

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "platform/linux/sd_bus_handles.h"
#include "platform/message.h"
#include "services/hints/outcome.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

class BusCall {
public:
    using Answer = std::function<void(Outcome<platform::Message>)>;

    struct Method {
        std::string destination;
        const char* interface;
        const char* member;
    };

    BusCall(sd_event* event, const Method& method, const platform::Message& request, Answer answer);
    BusCall(const BusCall&) = delete;
    BusCall& operator=(const BusCall&) = delete;
    ~BusCall();

private:
    // Why the call is not on its way; none when it is.
    std::optional<std::string> start(sd_event* event, const Method& method,
                                     const platform::Message& request);
    static int onReply(sd_bus_message* reply, void* self, sd_bus_error* error);
    void finish(Outcome<platform::Message> outcome);

    Answer _answer;
    platform::LeavingSdBus _bus;
    platform::SdBusSlot _call;
    EventSource _later;
};

}  // namespace vlm::service
