// UnlockKeyStore: the wrapped unlock keys, each beside the pairing that it belongs to.
//
// Shapes:    an unlock key belongs to one pairing (account and public-key hash), and goes with it.
//            What is stored can be opened by the card alone.
// Threads:   one.
// Blocking:  for the disk only; what was stored is on disk when the call returns.
// Errors:    status kStoreFailed with a text; kNotPaired for a pairing that is not there.
// Behind it: services/hints/sqlite_pairing_store.h
// In tests:  tests/fakes/fake_pairing_store.h, tests/integration/service/unlock_key_store_test.cpp

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "platform/types.h"
#include "services/hints/outcome.h"

namespace vlm::service {

struct UnlockKey {
    std::string account;
    platform::Bytes hash;            // the paired key
    platform::Bytes wrapKeyHash;     // the key that opens it
    platform::Bytes wrapPublicInfo;  // its DER SubjectPublicKeyInfo, to wrap a new password with
    platform::Bytes wrapped;         // services/keychain/unlock_key_wrapping.h

    bool operator==(const UnlockKey&) const = default;
};

class UnlockKeyStore {
public:
    virtual ~UnlockKeyStore() = default;

    // Replaces the one that is there.
    virtual std::optional<Refusal> storeUnlockKey(const UnlockKey& key) = 0;

    // All of them, or none.
    virtual std::optional<Refusal> storeUnlockKeys(const std::vector<UnlockKey>& keys) = 0;

    virtual Outcome<std::optional<UnlockKey>> unlockKey(const std::string& account,
                                                        const platform::Bytes& hash) = 0;
    virtual Outcome<std::vector<UnlockKey>> unlockKeysOf(const std::string& account) = 0;

    // Whether there was one.
    virtual Outcome<bool> eraseUnlockKey(const std::string& account,
                                         const platform::Bytes& hash) = 0;
};

}  // namespace vlm::service
