// The stored form of a wrapped unlock key, taken apart and put together: docs/unlock-key.md says
// it byte by byte.
//
// Ownership: parts point into what was taken apart. Threads: functions of their arguments.
// In tests:  tests/unit/services/keychain/, fuzz/

#pragma once

#include <cstdint>
#include <optional>
#include <span>

#include "services/hints/tokens.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

inline constexpr std::size_t kNonceBytes = 12;
inline constexpr std::size_t kTagBytes = 16;

// What is encrypted: the size of the unlock key in two bytes, the key, and zeros up to the longest
// that there can be, so that the stored form does not tell how long a password is.
inline constexpr std::size_t kSizeBytes = 2;
inline constexpr std::size_t kPaddedBytes = kSizeBytes + kMostUnlockKeyBytes;

struct WrappedForm {
    WrapScheme scheme = WrapScheme::RsaOaepSha256;
    std::span<const std::uint8_t> front;  // all that stands before the ciphertext
    std::span<const std::uint8_t> sealed;
    std::span<const std::uint8_t> nonce;
    std::span<const std::uint8_t> ciphertext;
    std::span<const std::uint8_t> tag;
};

// None for what is no such form, of this version, from its first byte to its last.
std::optional<WrappedForm> readWrappedForm(std::span<const std::uint8_t> wrapped);

// The form up to the ciphertext; none for a sealed part that such a form cannot hold.
std::optional<Bytes> wrappedFront(WrapScheme scheme, const Bytes& sealed,
                                  std::span<const std::uint8_t, kNonceBytes> nonce);

// What is authenticated along with the unlock key: the front, and what the key is good for. Each
// part has its size before it, so that no byte can be moved from one to the next.
Bytes associatedData(std::span<const std::uint8_t> front, const UnlockKeyPurpose& purpose);

}  // namespace vlm::service
