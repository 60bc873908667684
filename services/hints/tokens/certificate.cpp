#include "services/hints/tokens/certificate.h"

#include <openssl/core_names.h>

#include "services/hints/tokens/card_text.h"
#include "services/hints/tokens/key_strength.h"
#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/tokens/openssl_time.h"
#include "services/hints/tokens/signature.h"

namespace vlm::service {
namespace {

std::string textOf(const ASN1_STRING* string) {
    unsigned char* utf8 = nullptr;
    const int size = ASN1_STRING_to_UTF8(&utf8, string);
    if (size < 0) return {};
    std::string text(reinterpret_cast<const char*>(utf8), static_cast<std::size_t>(size));
    OPENSSL_free(utf8);
    return cardText(text);
}

std::string subjectField(const X509* certificate, int nid) {
    const X509_NAME* subject = X509_get_subject_name(certificate);
    const int index = X509_NAME_get_index_by_NID(subject, nid, -1);
    if (index < 0) return {};
    return textOf(X509_NAME_ENTRY_get_data(X509_NAME_get_entry(subject, index)));
}

// The text of the alternative name's first entry of the kind that `pick` takes.
template <typename Pick>
std::string alternateName(const GENERAL_NAMES* names, Pick pick) {
    for (int i = 0; i < sk_GENERAL_NAME_num(names); ++i) {
        const ASN1_STRING* string = pick(*sk_GENERAL_NAME_value(names, i));
        if (string == nullptr) continue;
        if (std::string text = textOf(string); !text.empty()) return text;
    }
    return {};
}

const ASN1_STRING* emailOf(const GENERAL_NAME& name) {
    return name.type == GEN_EMAIL ? name.d.rfc822Name : nullptr;
}

const ASN1_STRING* principalOf(const GENERAL_NAME& name) {
    if (name.type != GEN_OTHERNAME || OBJ_obj2nid(name.d.otherName->type_id) != NID_ms_upn)
        return nullptr;
    const ASN1_TYPE* value = name.d.otherName->value;
    return value->type == V_ASN1_UTF8STRING ? value->value.utf8string : nullptr;
}

std::string nameOf(const X509* certificate) {
    if (std::string name = subjectField(certificate, NID_commonName); !name.empty()) return name;
    if (std::string email = subjectField(certificate, NID_pkcs9_emailAddress); !email.empty())
        return email;
    const GeneralNames names(static_cast<GENERAL_NAMES*>(
        X509_get_ext_d2i(certificate, NID_subject_alt_name, nullptr, nullptr)));
    if (!names) return {};
    if (std::string email = alternateName(names.get(), emailOf); !email.empty()) return email;
    return alternateName(names.get(), principalOf);
}

Bytes number(const EVP_PKEY* key, const char* name, std::size_t size) {
    BIGNUM* raw = nullptr;
    if (EVP_PKEY_get_bn_param(key, name, &raw) != 1) return {};
    const BignumHandle handle(raw);
    const auto needed = static_cast<std::size_t>(BN_num_bytes(raw));
    Bytes bytes(std::max(size, needed));
    if (BN_bn2binpad(raw, bytes.data(), static_cast<int>(bytes.size())) < 0) return {};
    return bytes;
}

// Fills in what the certificate says about its key; false for a key that is of no use here.
bool readKey(EVP_PKEY* key, CertificateFacts& facts) {
    if (key == nullptr) return false;
    const int kind = EVP_PKEY_get_base_id(key);
    if (kind == EVP_PKEY_RSA) {
        facts.keyKind = KeyKind::Rsa;
        facts.publicNumber = number(key, OSSL_PKEY_PARAM_RSA_N, 0);
    } else if (kind == EVP_PKEY_EC) {
        char curve[64];
        if (EVP_PKEY_get_group_name(key, curve, sizeof curve, nullptr) != 1) return false;
        facts.keyKind = KeyKind::Ec;
        const auto bits = static_cast<std::size_t>(EVP_PKEY_get_bits(key));
        facts.publicNumber = number(key, OSSL_PKEY_PARAM_EC_PUB_X, (bits + 7) / 8);
    }
    if (facts.publicNumber.empty()) return false;

    unsigned char* der = nullptr;
    const int size = i2d_PUBKEY(key, &der);
    if (size <= 0) return false;
    facts.publicKeyInfo.assign(der, der + size);
    OPENSSL_free(der);
    facts.publicKeyHash = sha256(facts.publicKeyInfo);
    return true;
}

void readKeyUsage(X509* certificate, CertificateFacts& facts) {
    const std::uint32_t usage = X509_get_key_usage(certificate);  // all bits when it is absent
    const bool rsa = facts.keyKind == KeyKind::Rsa;
    const bool strong = EVP_PKEY_get_bits(X509_get0_pubkey(certificate)) >=
                        (rsa ? kSmallestRsaKey : kSmallestCurve);
    const std::uint32_t wrapping =
        rsa ? KU_KEY_ENCIPHERMENT | KU_DATA_ENCIPHERMENT : KU_KEY_AGREEMENT;
    facts.maySign = (usage & (KU_DIGITAL_SIGNATURE | KU_NON_REPUDIATION)) != 0;
    facts.mayWrap = strong && (usage & wrapping) != 0;
}

}  // namespace

std::optional<CertificateFacts> readCertificate(std::span<const std::uint8_t> der) {
    const QuietErrors quiet;
    const unsigned char* start = der.data();
    const X509Handle certificate(d2i_X509(nullptr, &start, static_cast<long>(der.size())));
    if (!certificate) return {};

    CertificateFacts facts;
    const auto notBefore = secondsOf(X509_get0_notBefore(certificate.get()));
    const auto notAfter = secondsOf(X509_get0_notAfter(certificate.get()));
    if (!notBefore || !notAfter || !readKey(X509_get0_pubkey(certificate.get()), facts)) return {};
    facts.notBefore = *notBefore;
    facts.notAfter = *notAfter;
    facts.name = nameOf(certificate.get());
    readKeyUsage(certificate.get(), facts);
    return facts;
}

}  // namespace vlm::service
