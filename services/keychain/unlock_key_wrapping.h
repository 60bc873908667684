// Wrapping an unlock key, so that one card can open it, for one pairing only.
//
// The unlock key is the password of an account's login keyring. It is sealed with AES-256-GCM; the
// key of that comes by HKDF (RFC 5869) from a secret that only the card can recover: random bytes
// encrypted to its RSA key (RFC 8017), or the common point of its EC key and an ephemeral one
// (SP 800-56A). Account, paired key and wrap key are authenticated with it. docs/unlock-key.md has
// the stored form, byte by byte.
//
// Threads: functions of their arguments. Errors: none; why is of no use to who asks, and of some
// to who attacks.
// In tests: tests/unit/services/keychain/, fuzz/

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "platform/types.h"
#include "services/hints/secret.h"
#include "services/hints/tokens.h"

namespace vlm::service {

inline constexpr std::size_t kMostUnlockKeyBytes = 1024;
inline constexpr std::size_t kMostWrappedBytes = 8192;

// What a wrapped key is good for.
struct UnlockKeyPurpose {
    std::string account;
    Bytes publicKeyHash;
    Bytes wrapKeyHash;
};

std::optional<Bytes> wrapUnlockKey(const Secret& unlockKey, const UnlockKeyPurpose& purpose,
                                   const Bytes& wrapPublicInfo, WrapScheme scheme);

// What the card has to open; none for what is no wrapped unlock key.
std::optional<OpenRequest> cardTask(std::span<const std::uint8_t> wrapped,
                                    const Bytes& wrapKeyHash);

// The unlock key, from what the card made of that task; none where anything was changed.
std::optional<Secret> unwrapUnlockKey(std::span<const std::uint8_t> wrapped, const Secret& opened,
                                      const UnlockKeyPurpose& purpose);

}  // namespace vlm::service
