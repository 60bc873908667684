// UserKeyrings: a user's login keyring, as it is reached through that user's own instance of this
// service. The daemon itself calls into nobody's session.
//
// Ownership: destroying the returned object gives the question up; there is no answer then.
// Threads:   the event loop's; the answer is called there at most once, never before the asking
//            call has returned.
// Blocking:  never; a person has ten minutes.
// Errors:    refusals: kNoKeyring where there is no keyring or nobody to ask, kKeyringRefused for a
//            wrong password, kCancelled. Their text is the end of a sentence that says why.
// Behind it: services/hints/bus_user_keyrings.h
// In tests:  tests/fakes/fake_user_keyrings.h

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "platform/types.h"
#include "services/hints/outcome.h"
#include "services/hints/secret.h"

namespace vlm::service {

// Shown to the person, but for the keyring, which is the one that was named before.
struct KeyringQuestion {
    std::string card;
    std::string account;
    std::string keyring;
};

class UserKeyrings {
public:
    class Question {
    public:
        virtual ~Question() = default;
    };

    virtual ~UserKeyrings() = default;

    // Where on the user's bus the login keyring is.
    virtual std::unique_ptr<Question> name(platform::UserId user,
                                           std::function<void(Outcome<std::string>)> answer) = 0;

    // The keyring's password: asked of the person, and tried.
    virtual std::unique_ptr<Question> askPassword(platform::UserId user,
                                                  const KeyringQuestion& question,
                                                  std::function<void(Outcome<Secret>)> answer) = 0;

    virtual std::unique_ptr<Question> unlock(
        platform::UserId user, const Secret& password,
        std::function<void(std::optional<Refusal>)> answer) = 0;
};

}  // namespace vlm::service
