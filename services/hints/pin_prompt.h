// PinPrompt: asks a person for the PIN of a card.
//
// Ownership: the question is withdrawn when the returned object is destroyed; there is no answer
//            then.
// Threads:   the event loop's; the answer is called there at most once, never before ask() has
//            returned.
// Blocking:  never; a person may take minutes.
// Errors:    a person who cannot be asked is an answer, with the reason.
// Behind it: services/hints/caller_pin_prompt.h
// In tests:  tests/fakes/fake_pin_prompt.h

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "services/hints/caller.h"
#include "services/hints/secret.h"
#include "services/hints/tokens.h"

namespace vlm::service {

struct PinQuestion {
    std::string card;  // names as people know them, harmless as tokens.h promises
    std::string identity;
    PinState state = PinState::Ready;
    std::string account;  // that can be paired then; empty when it may be any
    Caller caller;        // for whom; the person in front of this program is asked
};

struct PinAnswer {
    enum class Outcome { Given, Cancelled, TimedOut, Unavailable };
    Outcome outcome = Outcome::Unavailable;
    Secret pin;          // Given; never empty
    std::string reason;  // Unavailable: the end of a sentence, "there is no ..."
};

class PinPrompt {
public:
    using Answer = std::function<void(PinAnswer)>;

    class Question {
    public:
        virtual ~Question() = default;
    };

    virtual ~PinPrompt() = default;

    virtual std::unique_ptr<Question> ask(const PinQuestion& question, Answer answer) = 0;
};

}  // namespace vlm::service
