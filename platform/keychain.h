// Keychain: the unlock keys that open a user's login keyring after a login with a card.
//
// The user is the one at the console: whoever calls has made sure that this is who is meant.
//
// Shapes:    a key is named by its public-key hash, a token by its identifier.
// Ownership: the keyring that was copied is released with the object that stands for it.
// Threads:   any.
// Blocking:  yes, on the keychain service; storing may wait for a person who types a password.
// Errors:    a status; 0 for success. Statuses of the service come through as they are.
// Behind it: platform/linux/service_keychain.h
// In tests:  tests/fakes/fake_keychain.h, tests/contracts/keychain_contract.h

#pragma once

#include <memory>
#include <string>

#include "platform/types.h"

namespace vlm::platform {

// A user's login keyring.
class LoginKeychain {
public:
    virtual ~LoginKeychain() = default;

    // What the service calls it.
    virtual const std::string& name() const = 0;
};

class Keychain {
public:
    struct Copied {
        Status status = kSuccess;
        std::unique_ptr<LoginKeychain> keychain;  // there when the status is 0
    };

    virtual ~Keychain() = default;

    virtual Copied copyLoginKeychain() = 0;

    // Stores the key that opens the keyring, for the paired key and wrapped by the token's wrap
    // key. One that is there is replaced. Nothing reads the text yet.
    virtual Status storeUnlockKey(const Bytes& publicKeyHash, const std::string& token,
                                  const Bytes& wrapKeyHash, const LoginKeychain& keychain,
                                  const std::string& text) = 0;

    // Erases the unlock key that belongs to a public-key hash. None there is success.
    virtual Status eraseUnlockKey(const Bytes& publicKeyHash) = 0;
};

}  // namespace vlm::platform
