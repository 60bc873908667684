// LoginKeyring: the login keyring of the user whose session this is.
//
// Ownership: destroying the returned object gives the work up; there is no answer then.
// Threads:   the event loop's; the answer is called there at most once, never before the call has
//            returned.
// Blocking:  never; a keyring that does not answer costs a time limit.
// Errors:    answers.
// Behind it: services/keychain/secret_service_keyring.h
// In tests:  tests/fakes/fake_login_keyring.h

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "services/hints/secret.h"

namespace vlm::service {

struct FoundKeyring {
    std::string path;              // its object on the session bus
    bool checksPasswords = false;  // whether tryPassword() can be asked

    bool operator==(const FoundKeyring&) const = default;
};

enum class KeyringVerdict {
    Opened,  // it is open now, by this password
    Refused,
    Failed,  // it was not told
};

class LoginKeyring {
public:
    class Work {
    public:
        virtual ~Work() = default;
    };

    virtual ~LoginKeyring() = default;

    // None when there is none. Nothing is started and nothing is made to find one.
    virtual std::unique_ptr<Work> find(std::function<void(std::optional<FoundKeyring>)> answer) = 0;

    // Opens the keyring with the password, just as a login does. One that is open already checks
    // it all the same. Only for a keyring that was found and checks passwords: it might be made.
    virtual std::unique_ptr<Work> tryPassword(const Secret& password,
                                              std::function<void(KeyringVerdict)> answer) = 0;
};

}  // namespace vlm::service
