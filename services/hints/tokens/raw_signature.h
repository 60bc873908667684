// What goes into a card's plain signing operation, and what comes out of it.

#pragma once

#include <span>

#include "services/hints/tokens/certificate.h"

namespace vlm::service {

// The challenge's SHA-256 as the key signs it: for RSA in its DigestInfo; for EC cut to the size of
// the curve, as ECDSA would.
Bytes signatureInput(const CertificateFacts& facts, std::span<const std::uint8_t> challenge);

// The two numbers of an ECDSA signature, one behind the other, in DER; empty when it is not two.
Bytes ecdsaSignatureDer(std::span<const std::uint8_t> numbers);

}  // namespace vlm::service
