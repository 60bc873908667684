// ForwardingService: what the user's instance answers. It knows no cards and keeps no pairings: it
// passes on to the daemon what a user's own programs may ask of it, and refuses the rest.
//
// The caller sees one service; that the daemon answers is told only where it matters.
//
// Ownership: its parts outlive it. Threads: the event loop's. Blocking: never.
// In tests:  tests/unit/services/forwarding_service_test.cpp

#pragma once

#include <cstdint>
#include <map>
#include <memory>

#include "services/hints/caller.h"
#include "services/hints/daemon_link.h"
#include "services/hints/exchanges.h"
#include "services/hints/request.h"

namespace vlm::service {

class ForwardingService final : public Exchanges {
public:
    ForwardingService(DaemonLink& daemon, CallerWatch& callers)
        : _daemon(daemon), _callers(callers) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override;

private:
    struct Forwarded {
        std::unique_ptr<DaemonLink::Call> call;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    void forward(const Caller& caller, const platform::Message& request, Reply reply);

    DaemonLink& _daemon;
    CallerWatch& _callers;
    std::map<std::uint64_t, Forwarded> _forwarded;
    std::uint64_t _last = 0;
};

}  // namespace vlm::service
