#include "tests/tools/certificates/certificate_maker.h"

#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/x509v3.h>

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/tokens/signature.h"

namespace vlm::test {
namespace {

using platform::Bytes;
using service::RevocationList;
using service::X509Handle;
using SharedKey = std::shared_ptr<EVP_PKEY>;
using Extension = std::unique_ptr<X509_EXTENSION, service::OpensslFree<X509_EXTENSION_free>>;

void check(bool isDone) {
    if (!isDone) throw std::runtime_error("a test's certificate cannot be made");
}

template <typename Object>
Bytes derOf(const Object* object, int (*encode)(const Object*, unsigned char**)) {
    Bytes der(static_cast<std::size_t>(std::max(0, encode(object, nullptr))));
    unsigned char* end = der.data();
    check(encode(object, &end) > 0);
    return der;
}

X509Handle decode(const Bytes& der) {
    const unsigned char* at = der.data();
    return X509Handle(d2i_X509(nullptr, &at, static_cast<long>(der.size())));
}

SharedKey freshKey(const std::string& kind) {
    SharedKey key(makeKey(kind).release(), EVP_PKEY_free);
    check(key != nullptr);
    return key;
}

// Without an issuer it is self-signed.
X509* issuerOr(X509* self, const X509Handle& issuer) { return issuer ? issuer.get() : self; }

void addExtension(X509* certificate, X509* issuer, int nid, const std::string& value) {
    if (value.empty()) return;
    X509V3_CTX context;
    X509V3_set_ctx(&context, issuer, certificate, nullptr, nullptr, 0);
    const Extension extension(X509V3_EXT_conf_nid(nullptr, &context, nid, value.c_str()));
    check(extension && X509_add_ext(certificate, extension.get(), -1) == 1);
}

void setName(X509* certificate, const std::string& name) {
    check(X509_NAME_add_entry_by_txt(X509_get_subject_name(certificate), "CN", MBSTRING_UTF8,
                                     reinterpret_cast<const unsigned char*>(name.data()),
                                     static_cast<int>(name.size()), -1, 0) == 1);
}

Bytes certify(const SharedKey& key, const CertificateRequest& request, const SharedKey& issuerKey,
              const X509Handle& issuer) {
    const X509Handle made(X509_new());
    X509* certificate = made.get();
    X509_set_version(certificate, X509_VERSION_3);
    std::uint64_t serial = 0;
    RAND_bytes(reinterpret_cast<unsigned char*>(&serial), sizeof serial);
    ASN1_INTEGER_set_uint64(X509_get_serialNumber(certificate), serial >> 1U);
    ASN1_TIME_set(X509_getm_notBefore(certificate), request.from);
    ASN1_TIME_set(X509_getm_notAfter(certificate), request.until);
    X509_set_pubkey(certificate, key.get());
    setName(certificate, request.commonName);
    X509* by = issuerOr(certificate, issuer);
    X509_set_issuer_name(certificate, X509_get_subject_name(by));
    addExtension(certificate, by, NID_basic_constraints, request.basicConstraints);
    addExtension(certificate, by, NID_key_usage, request.keyUsage);
    addExtension(certificate, by, NID_ext_key_usage, request.extendedKeyUsage);
    check(X509_sign(certificate, issuerKey.get(), request.withSha1 ? EVP_sha1() : EVP_sha256()) >
          0);
    return derOf<X509>(certificate, i2d_X509);
}

void addRevoked(X509_CRL* list, const Bytes& der, std::int64_t when) {
    const auto certificate = decode(der);
    X509_REVOKED* entry = X509_REVOKED_new();
    ASN1_TIME* date = ASN1_TIME_set(nullptr, when);
    X509_REVOKED_set_serialNumber(entry, X509_get_serialNumber(certificate.get()));
    X509_REVOKED_set_revocationDate(entry, date);
    ASN1_TIME_free(date);
    check(X509_CRL_add0_revoked(list, entry) == 1);
}

}  // namespace

CertificateRequest issuerCalled(const std::string& name) {
    CertificateRequest request{name};
    request.from = kToday - 1000 * kDay;
    request.until = kToday + 1000 * kDay;
    request.basicConstraints = "critical,CA:TRUE";
    request.keyUsage = "critical,keyCertSign,cRLSign";
    return request;
}

CertifiedKey CertifiedKey::selfSigned(const CertificateRequest& request, const std::string& kind) {
    auto key = freshKey(kind);
    auto der = certify(key, request, key, nullptr);
    return {std::move(key), std::move(der)};
}

CertifiedKey CertifiedKey::issue(const CertificateRequest& request, const std::string& kind) const {
    auto key = freshKey(kind);
    auto der = certify(key, request, _key, decode(_der));
    return {std::move(key), std::move(der)};
}

CertifiedKey CertifiedKey::certifyAgain(const CertifiedKey& other,
                                        const CertificateRequest& request) const {
    return {other._key, certify(other._key, request, _key, decode(_der))};
}

Bytes CertifiedKey::revoke(const ListRequest& request) const {
    const RevocationList made(X509_CRL_new());
    X509_CRL* list = made.get();
    X509_CRL_set_version(list, X509_CRL_VERSION_2);
    const auto issuer = decode(_der);
    X509_CRL_set_issuer_name(list, X509_get_subject_name(issuer.get()));
    ASN1_TIME* date = ASN1_TIME_set(nullptr, request.from);
    X509_CRL_set1_lastUpdate(list, date);
    ASN1_TIME_set(date, request.until);
    X509_CRL_set1_nextUpdate(list, date);
    ASN1_TIME_free(date);
    for (const auto& der : request.revoked) addRevoked(list, der, request.from);
    X509_CRL_sort(list);
    check(X509_CRL_sign(list, _key.get(), EVP_sha256()) > 0);
    return derOf<X509_CRL>(list, i2d_X509_CRL);
}

Bytes CertifiedKey::publicKeyHash() const {
    return service::sha256(derOf<EVP_PKEY>(_key.get(), i2d_PUBKEY));
}

std::string pem(const Bytes& der, const std::string& kind) {
    const std::unique_ptr<BIO, service::OpensslFree<BIO_free>> text(BIO_new(BIO_s_mem()));
    PEM_write_bio(text.get(), kind.c_str(), "", der.data(), static_cast<long>(der.size()));
    char* start = nullptr;
    const long size = BIO_get_mem_data(text.get(), &start);
    return {start, static_cast<std::size_t>(size)};
}

std::string asText(const Bytes& der) { return {der.begin(), der.end()}; }

}  // namespace vlm::test
