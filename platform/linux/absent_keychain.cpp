#include "platform/linux/absent_keychain.h"

#include "platform/platform.h"

namespace vlm::platform {

Status AbsentKeychain::eraseUnlockKey(const Bytes&) { return kNoKeychainService; }

Keychain& Platform::keychain() {
    static auto& service = *new AbsentKeychain;
    return service;
}

}  // namespace vlm::platform
