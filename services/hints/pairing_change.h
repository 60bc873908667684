// PairingChange: one pairing or unpairing, from the request to the answer.
//
// What can be refused without asking anybody is refused first: the account, a missing proof, a
// pairing that is not there, a session in which nobody can be asked. Only then an administrator is
// asked, where one has to allow it; so nobody is in vain. The proof is held meanwhile.
//
// Ownership: by a shared pointer; dropping it withdraws the question, gives the proof back, and
//            nothing is changed.
// Threads:   the event loop's. Blocking: for the pairings only.
// Errors:    the answer is a refusal.
// In tests:  tests/unit/services/pairing_change_test.cpp

#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/administrator_right.h"
#include "services/hints/caller.h"
#include "services/hints/caller_sessions.h"
#include "services/hints/outcome.h"
#include "services/hints/pairing_store.h"
#include "services/hints/proofs.h"
#include "services/hints/request.h"
#include "services/hints/tokens.h"

namespace vlm::service {

// What a change works with; all of it outlives the change.
struct PairingChangeParts {
    Tokens& tokens;
    PairingStore& pairings;
    Proofs& proofs;
    CallerSessions& sessions;
    AdministratorRight& right;
    std::function<std::int64_t()> now;  // seconds since 1970-01-01 00:00:00 UTC
};

class PairingChange : public std::enable_shared_from_this<PairingChange> {
public:
    using Done = std::function<void(std::optional<Refusal>)>;

    // The request is one for pairing or unpairing, by a caller who may have that done. `done` is
    // called once, perhaps before start() has returned.
    PairingChange(const PairingChangeParts& parts, Caller caller, Request request, Done done)
        : _parts(parts),
          _caller(std::move(caller)),
          _request(std::move(request)),
          _done(std::move(done)) {}

    void start();

private:
    bool isPairing() const { return _request.operation == Operation::Pair; }
    std::optional<Refusal> refusalToPair();
    std::optional<Refusal> refusalToUnpair();
    void judgeSession(SessionState state);
    void askAdministrator(const std::vector<Token>& tokens);
    void carryOut();
    std::optional<Refusal> pair();
    std::optional<Refusal> unpair();
    Refusal refused(platform::Status status, std::string_view why) const;
    void end(std::optional<Refusal> refusal);

    const PairingChangeParts& _parts;
    const Caller _caller;
    const Request _request;
    Done _done;

    std::unique_ptr<Proofs::Held> _proof;
    std::unique_ptr<CallerSessions::Question> _sessionQuestion;
    std::unique_ptr<Authority::Question> _rightQuestion;
};

}  // namespace vlm::service
