// What the rest of this folder wants to know about a certificate on a card.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "platform/types.h"

namespace vlm::service {

using platform::Bytes;

enum class KeyKind { Rsa, Ec };

struct CertificateFacts {
    KeyKind keyKind = KeyKind::Rsa;
    Bytes publicKeyInfo;  // DER, as OpenSSL writes it
    Bytes publicKeyHash;  // SHA-256 of it
    Bytes publicNumber;   // RSA: the modulus without zeros in front; EC: the point's first
                          // coordinate in the curve's full size. Tells keys apart.
    std::string name;     // common name, else e-mail, else principal name; empty without any
    std::int64_t notBefore = 0;
    std::int64_t notAfter = 0;
    bool maySign = false;  // as far as the certificate goes; a key may still refuse
    bool mayWrap = false;

    bool validAt(std::int64_t seconds) const { return notBefore <= seconds && seconds <= notAfter; }
};

// None for what is no certificate, and for a key that is neither RSA nor EC on a named curve.
// Leaves nothing in OpenSSL's error queue.
std::optional<CertificateFacts> readCertificate(std::span<const std::uint8_t> der);

}  // namespace vlm::service
