// ForwardingService: what the user's instance answers. It opens its user's login keyring. It knows
// no cards and keeps no pairings: it passes on to the daemon what else a user's own programs may
// ask of it, and refuses the rest.
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
#include "services/keychain/login_keyring.h"

namespace vlm::service {

class ForwardingService final : public Exchanges {
public:
    ForwardingService(DaemonLink& daemon, LoginKeyring& keyring, CallerWatch& callers)
        : _daemon(daemon), _keyring(keyring), _callers(callers) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override;

private:
    struct Begun {
        std::shared_ptr<void> work;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    void forward(const Caller& caller, const platform::Message& request, Reply reply);
    void unlockKeyring(const Caller& caller, Request request, Reply reply);
    void end(std::uint64_t number, Outcome<platform::Message> outcome, const Reply& reply);

    DaemonLink& _daemon;
    LoginKeyring& _keyring;
    CallerWatch& _callers;
    std::map<std::uint64_t, Begun> _begun;
    std::uint64_t _last = 0;
};

}  // namespace vlm::service
