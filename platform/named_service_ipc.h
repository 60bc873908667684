// NamedServiceIpc: talking to a service by its name, one keyed dictionary each way.
//
// Shapes:    platform/message.h.
// Ownership: a connection belongs to whoever asked for it, and is closed when it is destroyed.
// Threads:   any; a connection is used by one thread at a time.
// Blocking:  sendAndWait() blocks until the reply is there; there is no time-out, since a person
//            may be typing a PIN at the other end.
// Errors:    an exchange that fails (no bus, no such service, a service that died, a message that
//            cannot be sent) is a reply that carries an error entry and nothing else.
// Behind it: platform/linux/sd_bus_named_service_ipc.h
// In tests:  tests/fakes/fake_named_service_ipc.h, tests/contracts/named_service_ipc_contract.h

#pragma once

#include <functional>
#include <memory>
#include <string_view>

#include "platform/message.h"

namespace vlm::platform {

// Whose service it is: the machine's, or the user's own.
enum class ServiceScope { Machine, User };

enum class ConnectionEvent {
    Interrupted,  // the service went away; a later exchange may find it again
    Invalid,      // there is no such service to talk to
};

class Connection {
public:
    using EventHandler = std::function<void(ConnectionEvent)>;

    virtual ~Connection() = default;

    // Called on the thread that runs an exchange, when that exchange shows the event.
    virtual void setEventHandler(EventHandler handler) = 0;

    // Makes the connection ready for exchanges; it is made suspended, so that a handler can be
    // set before anything happens.
    virtual void resume() = 0;

    // Sends one request and waits for its reply.
    virtual Message sendAndWait(const Message& request) = 0;
};

class NamedServiceIpc {
public:
    virtual ~NamedServiceIpc() = default;

    // A new, suspended connection. Never null: a service that is not there shows in the exchange.
    virtual std::unique_ptr<Connection> connect(std::string_view serviceName,
                                                ServiceScope scope) = 0;
};

}  // namespace vlm::platform
