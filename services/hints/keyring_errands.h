// What the user's instance does with the login keyring for the daemon: NameKeyring(),
// AskKeyringPassword() and UnlockKeyring().
//
// In tests: tests/unit/services/keyring_errands_test.cpp

#pragma once

#include "services/hints/daemon_errand.h"
#include "services/hints/password_prompt.h"
#include "services/keychain/login_keyring.h"

namespace vlm::service {

class KeyringNaming final : public DaemonErrand {
public:
    KeyringNaming(LoginKeyring& keyring, CallerWatch& callers)
        : DaemonErrand(callers), _keyring(keyring) {}

private:
    Outcome<Work> begin(const Caller& caller, const platform::Message& request,
                        Reply reply) override;

    LoginKeyring& _keyring;
};

class KeyringPasswordAsking final : public DaemonErrand {
public:
    KeyringPasswordAsking(PasswordPrompt& prompt, LoginKeyring& keyring, CallerWatch& callers)
        : DaemonErrand(callers), _prompt(prompt), _keyring(keyring) {}

private:
    Outcome<Work> begin(const Caller& caller, const platform::Message& request,
                        Reply reply) override;

    PasswordPrompt& _prompt;
    LoginKeyring& _keyring;
};

class KeyringOpening final : public DaemonErrand {
public:
    KeyringOpening(LoginKeyring& keyring, CallerWatch& callers)
        : DaemonErrand(callers), _keyring(keyring) {}

private:
    Outcome<Work> begin(const Caller& caller, const platform::Message& request,
                        Reply reply) override;

    LoginKeyring& _keyring;
};

}  // namespace vlm::service
