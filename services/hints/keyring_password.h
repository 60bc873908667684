// KeyringPassword: the password of the login keyring, from the question to a password that opens
// it.
//
// The keyring is looked for first, so that nobody is asked in vain. The person is asked once; after
// a wrong password again, three times at most. A keyring that checks no password lets it be typed
// twice, and the log says so.
//
// Ownership: its parts outlive it; destroying it withdraws what is asked.
// Threads:   the event loop's; `done` is called once, never before the constructor has ended.
// Blocking:  never. Errors: the answer is a refusal.
// In tests:  tests/unit/services/keyring_password_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>

#include "services/hints/outcome.h"
#include "services/hints/password_prompt.h"
#include "services/hints/secret.h"
#include "services/hints/user_keyrings.h"
#include "services/keychain/login_keyring.h"

namespace vlm::service {

class KeyringPassword {
public:
    using Done = std::function<void(Outcome<Secret>)>;

    KeyringPassword(PasswordPrompt& prompt, LoginKeyring& keyring, KeyringQuestion question,
                    Done done);
    KeyringPassword(const KeyringPassword&) = delete;
    KeyringPassword& operator=(const KeyringPassword&) = delete;

private:
    static constexpr int kTries = 3;

    void take(std::optional<FoundKeyring> found);
    void ask();
    void take(PinAnswer answer);
    void judge(KeyringVerdict verdict);
    void end(Outcome<Secret> outcome);

    PasswordPrompt& _prompt;
    LoginKeyring& _keyring;
    const KeyringQuestion _question;
    Done _done;

    bool _checksPasswords = false;
    int _wrongTries = 0;
    Secret _password;
    std::unique_ptr<LoginKeyring::Work> _work;
    std::unique_ptr<PasswordPrompt::Question> _asked;
};

}  // namespace vlm::service
