// BusService: a service on a bus, answered by a function of the test's on a thread of its own.
//
// Threads: the function runs on the service's thread; what it touches is the test's to share.
// Errors:  the constructor throws when the service cannot be put on the bus.

#pragma once

#include <functional>
#include <optional>
#include <string>

#include "platform/linux/sd_bus_handles.h"
#include "platform/message.h"
#include "tests/integration/linux/bus_thread.h"

namespace vlm::test {

class BusService {
public:
    using Answer = std::function<platform::Message(const platform::Message& request)>;
    // Answers a call in a way of its own; the result is that of an sd-bus method handler.
    using Handler = std::function<int(sd_bus_message* call)>;

    BusService(const std::string& address, const std::string& name, Answer answer);
    BusService(const std::string& address, const std::string& name, Handler handler,
               std::string resultSignature = "a{sv}");

    // The service leaves the bus with the object, with calls unanswered if there are any.
    BusService(const BusService&) = delete;
    BusService& operator=(const BusService&) = delete;

private:
    static int dispatch(sd_bus_message* call, void* service, sd_bus_error* error);

    const Handler _handler;
    const std::string _resultSignature;
    sd_bus_vtable _methods[3];
    platform::SdBus _bus;
    platform::SdBusSlot _object;
    std::optional<BusThread> _thread;
};

// The handler of exchanges that answers each with what this function says.
BusService::Handler answering(BusService::Answer answer);

// A connection to the bus at an address.
platform::SdBus connectTo(const std::string& address);

}  // namespace vlm::test
