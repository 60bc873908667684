// The keychain of a machine that has no keychain service: nothing is kept, so nothing is erased.

#pragma once

#include "platform/keychain.h"

namespace vlm::platform {

inline constexpr Status kNoKeychainService = -3000;

class AbsentKeychain final : public Keychain {
public:
    // Always kNoKeychainService.
    Status eraseUnlockKey(const Bytes& publicKeyHash) override;
};

}  // namespace vlm::platform
