// CallerSessions: whether the session that a caller belongs to is one in which a person at this
// machine can be asked.
//
// Ownership: destroying the returned object gives the question up; there is no answer then.
// Threads:   the event loop's; the answer is called there at most once, never before ask() has
//            returned.
// Blocking:  no.
// Errors:    a session that nothing can be learnt of is SessionState::Unknown.
// Behind it: services/hints/logind_caller_sessions.h
// In tests:  tests/fakes/fake_caller_sessions.h

#pragma once

#include <functional>
#include <memory>

#include "services/hints/caller.h"

namespace vlm::service {

enum class SessionState {
    Attended,  // in the foreground of this machine, and not locked
    None,      // the caller belongs to no session of its user
    Away,      // comes from another machine, or has no screen and keyboard here
    Inactive,  // another session is in the foreground
    Locked,
    Unknown,
};

class CallerSessions {
public:
    using Answer = std::function<void(SessionState)>;

    class Question {
    public:
        virtual ~Question() = default;
    };

    virtual ~CallerSessions() = default;

    virtual std::unique_ptr<Question> ask(const Caller& caller, Answer answer) = 0;
};

}  // namespace vlm::service
