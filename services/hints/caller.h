// Caller: who sent a request, as the bus says it; never what the request says.
//
// CallerWatch tells when a caller leaves the bus, so that nobody is asked for a PIN on behalf of a
// program that is gone.
//
// Threads:   the event loop's.
// Blocking:  never.
// Errors:    a caller that cannot be watched has no watch.
// Behind it: services/hints/bus_caller_watch.h
// In tests:  tests/fakes/fake_caller_watch.h

#pragma once

#include <sys/types.h>

#include <functional>
#include <memory>
#include <string>

#include "platform/types.h"

namespace vlm::service {

struct Caller {
    platform::UserId user = platform::kNobody;
    pid_t process = 0;
    std::string connection;  // its unique name on the bus

    bool isRoot() const { return user == 0; }
};

class CallerWatch {
public:
    // Ends the watch when it is destroyed.
    class Watch {
    public:
        virtual ~Watch() = default;
    };

    virtual ~CallerWatch() = default;

    // Calls `left` once, when the connection is gone; never before this has returned. Null, and no
    // call, when it cannot be watched: it may be gone already.
    virtual std::unique_ptr<Watch> watch(const std::string& connection,
                                         std::function<void()> left) = 0;
};

}  // namespace vlm::service
