#include "tests/tools/soft_card/test_key.h"

#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/objects.h>
#include <openssl/rand.h>
#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include <map>

namespace vlm::test {
namespace {

struct BignumFree {
    void operator()(BIGNUM* number) const { BN_clear_free(number); }
};
struct X509Free {
    void operator()(X509* certificate) const { X509_free(certificate); }
};
struct ExtensionFree {
    void operator()(X509_EXTENSION* extension) const { X509_EXTENSION_free(extension); }
};
using Certificate = std::unique_ptr<X509, X509Free>;

template <typename Object>
Octets derOf(const Object* object, int (*encode)(const Object*, unsigned char**)) {
    Octets der(static_cast<std::size_t>(encode(object, nullptr)), '\0');
    auto* end = reinterpret_cast<unsigned char*>(der.data());
    encode(object, &end);
    return der;
}

bool addName(X509_NAME* name, const char* field, const std::string& value) {
    if (value.empty()) return true;
    // Text is put in as it is, also when it is no UTF-8: cards hold such certificates too.
    return X509_NAME_add_entry_by_txt(name, field, V_ASN1_UTF8STRING,
                                      reinterpret_cast<const unsigned char*>(value.data()),
                                      static_cast<int>(value.size()), -1, 0) == 1;
}

bool addExtension(X509* certificate, int nid, const std::string& value) {
    if (value.empty()) return true;
    X509V3_CTX context;
    X509V3_set_ctx(&context, certificate, certificate, nullptr, nullptr, 0);
    const std::unique_ptr<X509_EXTENSION, ExtensionFree> extension(
        X509V3_EXT_conf_nid(nullptr, &context, nid, value.c_str()));
    return extension && X509_add_ext(certificate, extension.get(), -1) == 1;
}

void setSerial(X509* certificate) {
    std::uint64_t number = 0;
    RAND_bytes(reinterpret_cast<unsigned char*>(&number), sizeof number);
    ASN1_INTEGER_set_uint64(X509_get_serialNumber(certificate), number >> 1U);
}

}  // namespace

Key makeKey(const std::string& kind) {
    static const std::map<std::string, std::size_t> kRsa = {
        {"rsa1024", 1024}, {"rsa2048", 2048}, {"rsa3072", 3072}, {"rsa4096", 4096}};
    static const std::map<std::string, const char*> kCurves = {
        {"p256", "P-256"}, {"p384", "P-384"}, {"p521", "P-521"}};
    if (const auto rsa = kRsa.find(kind); rsa != kRsa.end())
        return Key(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", rsa->second));
    if (const auto curve = kCurves.find(kind); curve != kCurves.end())
        return Key(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve->second));
    return nullptr;
}

bool isRsa(const Key& key) { return EVP_PKEY_get_base_id(key.get()) == EVP_PKEY_RSA; }

Octets keyNumber(const Key& key, const char* name) {
    BIGNUM* raw = nullptr;
    if (EVP_PKEY_get_bn_param(key.get(), name, &raw) != 1) return {};
    const std::unique_ptr<BIGNUM, BignumFree> number(raw);
    Octets octets(static_cast<std::size_t>(BN_num_bytes(raw)), '\0');
    BN_bn2bin(raw, reinterpret_cast<unsigned char*>(octets.data()));
    return octets;
}

Octets curveOf(const Key& key) {
    char name[64] = {};
    EVP_PKEY_get_group_name(key.get(), name, sizeof name, nullptr);
    return derOf(OBJ_txt2obj(name, 0), i2d_ASN1_OBJECT);
}

Octets pointOf(const Key& key) {
    unsigned char point[256];
    std::size_t size = 0;
    EVP_PKEY_get_octet_string_param(key.get(), OSSL_PKEY_PARAM_PUB_KEY, point, sizeof point, &size);
    ASN1_OCTET_STRING* string = ASN1_OCTET_STRING_new();
    ASN1_OCTET_STRING_set(string, point, static_cast<int>(size));
    Octets der = derOf(string, i2d_ASN1_OCTET_STRING);
    ASN1_OCTET_STRING_free(string);
    return der;
}

std::optional<CertificateParts> certify(const Key& key, const CardCertificate& certificate) {
    const Certificate made(X509_new());
    X509* x509 = made.get();
    X509_set_version(x509, X509_VERSION_3);
    setSerial(x509);
    X509_gmtime_adj(X509_getm_notBefore(x509), 0);
    X509_time_adj_ex(X509_getm_notBefore(x509), certificate.fromDay, 0, nullptr);
    X509_time_adj_ex(X509_getm_notAfter(x509), certificate.untilDay, 0, nullptr);
    X509_set_pubkey(x509, key.get());

    X509_NAME* name = X509_get_subject_name(x509);
    if (!addName(name, "CN", certificate.commonName) ||
        !addName(name, "emailAddress", certificate.email))
        return {};
    X509_set_issuer_name(x509, name);
    if (!addExtension(x509, NID_key_usage, certificate.keyUsage) ||
        !addExtension(x509, NID_subject_alt_name, certificate.alternateName) ||
        X509_sign(x509, key.get(), EVP_sha256()) == 0)
        return {};

    return CertificateParts{derOf<X509>(x509, i2d_X509), derOf<X509_NAME>(name, i2d_X509_NAME),
                            derOf<X509_NAME>(X509_get_issuer_name(x509), i2d_X509_NAME),
                            derOf<ASN1_INTEGER>(X509_get0_serialNumber(x509), i2d_ASN1_INTEGER)};
}

}  // namespace vlm::test
