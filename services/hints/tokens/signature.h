// Checks of what a card module hands over; the module is foreign code and is not believed.

#pragma once

#include <cstdint>
#include <span>

#include "platform/types.h"

namespace vlm::service {

platform::Bytes sha256(std::span<const std::uint8_t> data);

// Whether the signature over the challenge was made by the key whose hash was asked for: the hash
// is the SHA-256 of the DER SubjectPublicKeyInfo given, and the key made the signature (RSA of at
// least 2048 bits with PKCS#1 v1.5, or ECDSA in DER, both over SHA-256). Leaves nothing in
// OpenSSL's error queue.
bool verifySignature(std::span<const std::uint8_t> publicKeyInfo,
                     std::span<const std::uint8_t> publicKeyHash,
                     std::span<const std::uint8_t> challenge,
                     std::span<const std::uint8_t> signature);

}  // namespace vlm::service
