// HintsService: what the daemon answers, decided here.
//
// Every reply follows README.md. A refusal has its status in "res" and an error entry with a
// sentence; each is one log line, as is each change of a pairing.
//
// Ownership: its parts outlive it. Threads: the event loop's. Blocking: for the pairings only.
// In tests:  tests/unit/services/hints_service_test.cpp

#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <vector>

#include "services/hints/caller.h"
#include "services/hints/exchanges.h"
#include "services/hints/login.h"
#include "services/hints/login_policy.h"
#include "services/hints/pairing_change.h"
#include "services/hints/session_login.h"
#include "services/hints/token_info.h"
#include "services/hints/unlock_key_storing.h"

namespace vlm::service {

class HintsService final : public Exchanges {
public:
    struct Parts {
        LoginParts login;
        PairingChangeParts changes;
        UnlockKeyParts unlockKeys;
        SessionLogin sessionLogin;
        CallerWatch& callers;
    };

    explicit HintsService(Parts parts)
        : _parts(std::move(parts)),
          _loginPolicy({.pairings = _parts.changes.pairings, .now = _parts.changes.now}) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override;

private:
    // A login or a change under way, and the watch that ends it when its caller leaves.
    struct Running {
        std::shared_ptr<void> work;
        std::unique_ptr<CallerWatch::Watch> watch;
    };
    using Answer = std::function<void(Outcome<platform::Message>)>;

    void serve(const Caller& caller, Request request, const Answer& answer);
    void login(const Caller& caller, Request request, const Answer& answer);
    void findLoginCard(const Caller& caller, Request request, const Answer& answer);
    void logInWithCard(const Caller& caller, Request request, const Answer& answer);
    void describeTokens(const Caller& caller, const Request& request, const Answer& answer);
    Outcome<platform::Message> describeTokens(const Caller& caller, const std::string& onlyToken,
                                              const std::vector<Token>& tokens);
    void changePairing(const Caller& caller, Request request, const Answer& answer);
    void listPairings(const Request& request, const Answer& answer);
    void storeUnlockKey(const Caller& caller, Request request, const Answer& answer);
    void nameKeyring(const Caller& caller, const Request& request, const Answer& answer);
    void unlockKeyring(const Caller& caller, const Request& request, const Answer& answer);
    Outcome<platform::Message> changeUnlockKeys(const Caller& caller, const Request& request);
    Outcome<platform::Message> isPaired(const Request& request);
    Outcome<platform::Message> noteSessionLogin(const Request& request);

    // The number of what begins for the caller; none when the caller has left.
    std::optional<std::uint64_t> begin(const Caller& caller);
    void end(std::uint64_t number, Outcome<platform::Message> outcome, const Answer& answer);

    Parts _parts;
    const LoginPolicy _loginPolicy;
    std::map<std::uint64_t, Running> _running;
    std::uint64_t _last = 0;

    // Answers that come after the service is gone find this gone, too.
    std::shared_ptr<int> _alive = std::make_shared<int>();
};

}  // namespace vlm::service
