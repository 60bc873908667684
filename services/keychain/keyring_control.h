// KeyringControl: gives GNOME Keyring a password at its control socket, as its PAM module does.
//
// A request is a byte for the credentials, then numbers of 32 bits with the highest byte first: the
// request's length, the operation, the password's length, the password. The answer is its length
// and a result.
//
// Ownership: destroying it hangs up, and nothing is answered.
// Threads:   the event loop's; the answer is called once, never before the constructor ends.
// Blocking:  never; a daemon that does not answer costs ten seconds.
// In tests:  tests/integration/service/login_keyring_test.cpp

#pragma once

#include <systemd/sd-event.h>

#include <array>
#include <cstddef>
#include <functional>
#include <string>

#include "platform/linux/file_descriptor.h"
#include "services/hints/tokens/event_source.h"
#include "services/keychain/login_keyring.h"

namespace vlm::service {

class KeyringControl final : public LoginKeyring::Work {
public:
    using Answer = std::function<void(KeyringVerdict)>;

    KeyringControl(sd_event* event, const std::string& socket, const Secret& password,
                   Answer answer);
    KeyringControl(const KeyringControl&) = delete;
    KeyringControl& operator=(const KeyringControl&) = delete;
    ~KeyringControl() override = default;

private:
    // Why the password was not sent; empty when it was.
    std::string send(const std::string& socket, const Secret& password);
    void read();
    void fail(const std::string& why);
    void end(KeyringVerdict verdict);

    Answer _answer;
    platform::FileDescriptor _socket;
    std::array<unsigned char, 8> _reply = {};
    std::size_t _received = 0;
    EventSource _readable;
    EventSource _time;
};

}  // namespace vlm::service
