// KeyringUnlocking: opens the login keyring of this session's user with a password.
//
// Ownership: the keyring outlives it; destroying it gives it up.
// Threads:   the event loop's; `done` is called once, never before the constructor has ended.
// Blocking:  never. Errors: the answer is a refusal, whose text says why.
// In tests:  tests/unit/services/keyring_password_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>

#include "services/hints/outcome.h"
#include "services/hints/secret.h"
#include "services/keychain/login_keyring.h"

namespace vlm::service {

class KeyringUnlocking {
public:
    using Done = std::function<void(std::optional<Refusal>)>;

    KeyringUnlocking(LoginKeyring& keyring, Secret password, Done done);
    KeyringUnlocking(const KeyringUnlocking&) = delete;
    KeyringUnlocking& operator=(const KeyringUnlocking&) = delete;

private:
    void take(const std::optional<FoundKeyring>& found);
    void judge(KeyringVerdict verdict);
    void end(std::optional<Refusal> refusal);

    LoginKeyring& _keyring;
    const Secret _password;
    Done _done;
    std::unique_ptr<LoginKeyring::Work> _work;
};

}  // namespace vlm::service
