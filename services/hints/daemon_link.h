// DaemonLink: how the user's instance reaches the daemon.
//
// Ownership: a call is given up when the returned object is destroyed; the daemon then sees its
//            caller leave, and asks nobody for a PIN any more.
// Threads:   the event loop's; the answer is called there at most once, never before exchange()
//            has returned.
// Blocking:  no longer than a connection to a local socket takes.
// Errors:    kUnreachable, with a text.
// Behind it: services/hints/bus_daemon_link.h
// In tests:  tests/fakes/fake_daemon_link.h

#pragma once

#include <functional>
#include <memory>

#include "platform/message.h"
#include "services/hints/outcome.h"

namespace vlm::service {

class DaemonLink {
public:
    using Answer = std::function<void(Outcome<platform::Message>)>;

    class Call {
    public:
        virtual ~Call() = default;
    };

    virtual ~DaemonLink() = default;

    virtual std::unique_ptr<Call> exchange(const platform::Message& request, Answer answer) = 0;
};

}  // namespace vlm::service
