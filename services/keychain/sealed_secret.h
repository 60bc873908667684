// A fresh secret that only the holder of a private key can recover.
//
// Threads: functions of their arguments. Errors: none; the key is not one for this.
// In tests: tests/unit/services/keychain/

#pragma once

#include <optional>
#include <span>

#include "services/hints/secret.h"
#include "services/hints/tokens.h"

namespace vlm::service {

inline constexpr std::size_t kSealedRandomBytes = 32;

struct SealedSecret {
    Secret secret;  // RSA: random bytes; ECDH: the first coordinate of the common point
    Bytes sealed;   // what the private key makes it of, as in OpenRequest
};

// None for a key that is weak or broken (RSA below 2048 bits, a curve below 224), or not one that
// the scheme is for. Leaves nothing in OpenSSL's error queue.
std::optional<SealedSecret> sealFreshSecret(std::span<const std::uint8_t> publicKeyInfo,
                                            WrapScheme scheme);

}  // namespace vlm::service
