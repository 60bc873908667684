// Authority: asks who looks after this machine's rights whether a caller has the administrator's.
//
// Shapes:    the question's sentence may hold $(name) for each of its details; that is how a person
//            who is asked for a password sees them.
// Ownership: a question is withdrawn when the returned object is destroyed; there is no answer
// then. Threads:   the event loop's; an answer is called there at most once, never before the
// asking call
//            has returned.
// Blocking:  never; a person may take minutes.
// Errors:    an authority that does not answer is a verdict, with the reason.
// Behind it: services/hints/polkit_authority.h
// In tests:  tests/fakes/fake_authority.h

#pragma once

#include <functional>
#include <map>
#include <memory>
#include <string>

#include "platform/types.h"
#include "services/hints/caller.h"

namespace vlm::service {

struct RightQuestion {
    Caller caller;
    std::string sentence;
    std::map<std::string, std::string> details;  // harmless text
};

struct RightVerdict {
    enum class Outcome {
        Granted,
        Dismissed,    // by the person who was asked
        Denied,       // a wrong password, or the machine's rules
        NobodyToAsk,  // a password is needed, and nothing in the session asks for it
        Failed,
    };
    Outcome outcome = Outcome::Failed;
    // Granted: names a right that the authority keeps for the caller's process, and would give
    // again without asking; unlike any other name. Empty when it keeps none.
    std::string kept;
    std::string reason;  // Failed: the end of a sentence
};

class Authority {
public:
    using Answer = std::function<void(RightVerdict)>;

    class Question {
    public:
        virtual ~Question() = default;
    };

    virtual ~Authority() = default;

    virtual std::unique_ptr<Question> ask(const RightQuestion& question, Answer answer) = 0;
};

}  // namespace vlm::service
