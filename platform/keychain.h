// Keychain: the unlock keys that open a user's login keyring after a card login.
//
// Threads:   any.
// Blocking:  yes, on the keychain service.
// Errors:    a status; 0 for success.
// Behind it: platform/linux/absent_keychain.h
// In tests:  tests/fakes/fake_keychain.h

#pragma once

#include "platform/types.h"

namespace vlm::platform {

class Keychain {
public:
    virtual ~Keychain() = default;

    // Erases the unlock key that belongs to a public-key hash.
    virtual Status eraseUnlockKey(const Bytes& publicKeyHash) = 0;
};

}  // namespace vlm::platform
