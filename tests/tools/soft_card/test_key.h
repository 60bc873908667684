// A key pair that is made here and written to a card, and certificates for it.

#pragma once

#include <openssl/evp.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "tests/tools/soft_card/card_description.h"

namespace vlm::test {

using Octets = std::string;

struct KeyFree {
    void operator()(EVP_PKEY* key) const { EVP_PKEY_free(key); }
};
using Key = std::unique_ptr<EVP_PKEY, KeyFree>;

// A fresh key of the kind that CardIdentity::key names; null for a kind that is not known.
Key makeKey(const std::string& kind);

bool isRsa(const Key& key);

// A number of the key, big-endian, under its OpenSSL parameter name.
Octets keyNumber(const Key& key, const char* name);

// The curve as a DER object identifier, and the point as a DER octet string.
Octets curveOf(const Key& key);
Octets pointOf(const Key& key);

struct CertificateParts {
    Octets der;
    Octets subject;
    Octets issuer;
    Octets serial;
};

// A certificate that the key signed itself; none when an extension's text is not understood.
std::optional<CertificateParts> certify(const Key& key, const CardCertificate& certificate);

}  // namespace vlm::test
