// What a certificate says it is for. One that does not say is for anything.
//
// Threads: any. Errors: what cannot be read is for nothing.
// In tests: tests/unit/services/trust/certificate_trust_test.cpp

#pragma once

#include <openssl/x509v3.h>

#include <memory>

#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {

inline bool maySign(X509* certificate) {
    return (X509_get_key_usage(certificate) & KU_DIGITAL_SIGNATURE) != 0;
}

inline bool isMeantForSigningIn(const X509* certificate) {
    using Usages = std::unique_ptr<EXTENDED_KEY_USAGE, OpensslFree<EXTENDED_KEY_USAGE_free>>;
    int isCritical = 0;
    const Usages usages(static_cast<EXTENDED_KEY_USAGE*>(
        X509_get_ext_d2i(certificate, NID_ext_key_usage, &isCritical, nullptr)));
    if (!usages) return isCritical == -1;  // not there, and not broken either
    for (int i = 0; i < sk_ASN1_OBJECT_num(usages.get()); ++i) {
        const int usage = OBJ_obj2nid(sk_ASN1_OBJECT_value(usages.get(), i));
        if (usage == NID_client_auth || usage == NID_ms_smartcard_login ||
            usage == NID_anyExtendedKeyUsage)
            return true;
    }
    return false;
}

}  // namespace vlm::service
