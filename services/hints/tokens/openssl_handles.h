// The OpenSSL handles of this folder, and what keeps its error queue clean.

#pragma once

#include <openssl/asn1.h>
#include <openssl/bn.h>
#include <openssl/ec.h>
#include <openssl/err.h>
#include <openssl/evp.h>
#include <openssl/kdf.h>
#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include <memory>

namespace vlm::service {

template <auto release>
struct OpensslFree {
    template <typename Handle>
    void operator()(Handle* handle) const {
        release(handle);
    }
};

using X509Handle = std::unique_ptr<X509, OpensslFree<X509_free>>;
using KeyHandle = std::unique_ptr<EVP_PKEY, OpensslFree<EVP_PKEY_free>>;
using KeyContext = std::unique_ptr<EVP_PKEY_CTX, OpensslFree<EVP_PKEY_CTX_free>>;
using CipherContext = std::unique_ptr<EVP_CIPHER_CTX, OpensslFree<EVP_CIPHER_CTX_free>>;
using KdfHandle = std::unique_ptr<EVP_KDF, OpensslFree<EVP_KDF_free>>;
using KdfContext = std::unique_ptr<EVP_KDF_CTX, OpensslFree<EVP_KDF_CTX_free>>;
using RevocationList = std::unique_ptr<X509_CRL, OpensslFree<X509_CRL_free>>;
using DigestContext = std::unique_ptr<EVP_MD_CTX, OpensslFree<EVP_MD_CTX_free>>;
using BignumHandle = std::unique_ptr<BIGNUM, OpensslFree<BN_free>>;
using EcdsaSignature = std::unique_ptr<ECDSA_SIG, OpensslFree<ECDSA_SIG_free>>;
using GeneralNames = std::unique_ptr<GENERAL_NAMES, OpensslFree<GENERAL_NAMES_free>>;

// Takes back what the calls made while it lives put into the thread's error queue.
class QuietErrors {
public:
    QuietErrors() { ERR_set_mark(); }
    ~QuietErrors() { ERR_pop_to_mark(); }
    QuietErrors(const QuietErrors&) = delete;
    QuietErrors& operator=(const QuietErrors&) = delete;
};

}  // namespace vlm::service
