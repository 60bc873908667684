// BusServer: methods, `a{sv}` in and `a{sv}` out, of one interface of the hints service's object on
// a bus.
//
// Who calls is asked of the bus. Answers may come in any order and at any time; a caller that has
// left gets none, and a call that wants none is passed over. There is a bound on the requests that
// wait for their answers, for each user and in all, so that nobody can use up this program's memory
// or keep others out. A request waits until it is answered, or until the last copy of its reply is
// gone.
//
// Ownership: the bus and the exchanges outlive it. Threads: the event loop's.
// Blocking:  asks the bus once about each caller.
// Errors:    a message that is no such dictionary is refused like any other bad request.
// In tests:  tests/integration/service/bus_server_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <cstddef>
#include <map>
#include <memory>
#include <vector>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/bus_caller.h"
#include "services/hints/exchanges.h"

namespace vlm::service {

class BusServer {
public:
    static constexpr std::size_t kMostWaitingOfOneUser = 64;
    // Each has its caller watched, and the bus ends a connection that wants to be told of more than
    // 512 things.
    static constexpr std::size_t kMostWaiting = 384;

    struct Method {
        const char* name;
        Exchanges& exchanges;
    };

    // The names are literals.
    BusServer(sd_bus* bus, const char* interface, std::vector<Method> methods);
    BusServer(const BusServer&) = delete;
    BusServer& operator=(const BusServer&) = delete;

    // Puts the methods on the bus. False when the bus does not take it.
    bool start();

private:
    // How many requests wait, of each user who has any.
    using Counts = std::map<platform::UserId, std::size_t>;

    class Waiting;

    static int onCall(sd_bus_message* call, void* self, sd_bus_error* error);
    void receive(sd_bus_message* call);
    Exchanges& exchangesFor(sd_bus_message* call) const;
    bool isFull(platform::UserId user) const;
    void send(sd_bus_message* call, const platform::Message& content);

    sd_bus* _bus;
    const char* _interface;
    const std::vector<Method> _methods;
    std::vector<sd_bus_vtable> _members;
    platform::SdBusSlot _slot;
    KnownCallers _callers;

    // Shared with the requests that wait; answers that come after the server find it gone.
    std::shared_ptr<Counts> _counts = std::make_shared<Counts>();
};

}  // namespace vlm::service
