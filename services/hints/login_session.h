// LoginSession: whether a login may be asked for from where the caller is.
//
// Root's programs let people in: there is no session yet. A program of a user asks for a card that
// is in this machine, so it has to be in a session here; a locked one is what a screen locker is
// in.
//
// Ownership: destroying it gives the question up. Threads: the event loop's. Blocking: no.

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <utility>

#include "services/hints/caller.h"
#include "services/hints/caller_sessions.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"
#include "services/hints/status.h"

namespace vlm::service {

class LoginSession {
public:
    using Answer = std::function<void(const std::optional<Refusal>&)>;

    LoginSession(CallerSessions& sessions, Caller caller)
        : _sessions(sessions), _caller(std::move(caller)) {}

    // Calls `answer` once: at once for root, else later.
    void check(const Request& request, const Answer& answer) {
        if (_caller.isRoot()) return answer(std::nullopt);
        const auto refusal =
            refused(status::kUnattended, request,
                    "a card is taken only from who sits at this machine, in the foreground.");
        _question = _sessions.ask(_caller, [refusal, answer](SessionState state) {
            const bool isHere = state == SessionState::Attended || state == SessionState::Locked;
            answer(isHere ? std::nullopt : std::optional(refusal));
        });
    }

    const Caller& caller() const { return _caller; }

private:
    CallerSessions& _sessions;
    const Caller _caller;
    std::unique_ptr<CallerSessions::Question> _question;
};

}  // namespace vlm::service
