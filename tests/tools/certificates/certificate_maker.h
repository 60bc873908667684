// Certificates and revocation lists for tests: an issuer makes them as a test describes them, right
// or wrong.

#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "platform/types.h"
#include "tests/tools/soft_card/test_key.h"

namespace vlm::test {

// Seconds since 1970-01-01 00:00:00 UTC, at which the tests' certificates are looked at.
inline constexpr std::int64_t kToday = 1'700'000'000;
inline constexpr std::int64_t kDay = 86'400;

struct CertificateRequest {
    std::string commonName;
    std::int64_t from = kToday - 100 * kDay;
    std::int64_t until = kToday + 100 * kDay;
    std::string basicConstraints{};  // these in OpenSSL's notation; empty leaves them out
    std::string keyUsage{};
    std::string extendedKeyUsage{};
    bool withSha1 = false;
};

// For an issuer of certificates, which outlives them.
CertificateRequest issuerCalled(const std::string& name);

struct ListRequest {
    std::vector<platform::Bytes> revoked{};  // certificates, in DER
    std::int64_t from = kToday - kDay;
    std::int64_t until = kToday + kDay;
};

// A key with a certificate, which may make others.
class CertifiedKey {
public:
    static CertifiedKey selfSigned(const CertificateRequest& request,
                                   const std::string& kind = "p256");

    CertifiedKey issue(const CertificateRequest& request, const std::string& kind = "p256") const;
    platform::Bytes revoke(const ListRequest& request) const;

    // The same key and name in another certificate by this one.
    CertifiedKey certifyAgain(const CertifiedKey& other, const CertificateRequest& request) const;

    const platform::Bytes& der() const { return _der; }
    platform::Bytes publicKeyHash() const;

private:
    CertifiedKey(std::shared_ptr<EVP_PKEY> key, platform::Bytes der)
        : _key(std::move(key)), _der(std::move(der)) {}

    std::shared_ptr<EVP_PKEY> _key;
    platform::Bytes _der;
};

// In PEM; the kind is "CERTIFICATE" or "X509 CRL".
std::string pem(const platform::Bytes& der, const std::string& kind = "CERTIFICATE");
std::string asText(const platform::Bytes& der);

}  // namespace vlm::test
