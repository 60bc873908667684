// The login keyring as the Secret Service has it: the collection with the alias "login", else the
// one of that name.
//
// GNOME Keyring takes a password at its control socket, as its PAM module gives it one at a login.
// Other providers take none from programs.
//
// In tests: tests/integration/service/login_keyring_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <string>

#include "services/keychain/login_keyring.h"

namespace vlm::service {

class SecretServiceKeyring final : public LoginKeyring {
public:
    // The socket is looked for in the folder, XDG_RUNTIME_DIR's as a rule. The bus is on the loop
    // and outlives this and all its work.
    SecretServiceKeyring(sd_event* event, sd_bus* sessionBus, std::string runtimeFolder);

    std::unique_ptr<Work> find(std::function<void(std::optional<FoundKeyring>)> answer) override;
    std::unique_ptr<Work> tryPassword(const Secret& password,
                                      std::function<void(KeyringVerdict)> answer) override;

private:
    sd_event* _event;
    sd_bus* _bus;
    std::string _controlSocket;
};

// The user's folder for sockets.
std::string runtimeFolder();

}  // namespace vlm::service
