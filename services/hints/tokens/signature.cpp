#include "services/hints/tokens/signature.h"

#include <openssl/rsa.h>
#include <openssl/sha.h>

#include <algorithm>

#include "services/hints/tokens/key_strength.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {
namespace {

// The key, when it is of a kind that signs here and the DER holds nothing else.
KeyHandle readKey(std::span<const std::uint8_t> der) {
    const unsigned char* end = der.data();
    KeyHandle key(d2i_PUBKEY(nullptr, &end, static_cast<long>(der.size())));
    if (!key || end != der.data() + der.size()) return nullptr;
    const int kind = EVP_PKEY_get_base_id(key.get());
    const bool usable = kind == EVP_PKEY_EC ||
                        (kind == EVP_PKEY_RSA && EVP_PKEY_get_bits(key.get()) >= kSmallestRsaKey);
    return usable ? std::move(key) : nullptr;
}

}  // namespace

platform::Bytes sha256(std::span<const std::uint8_t> data) {
    platform::Bytes digest(SHA256_DIGEST_LENGTH);
    SHA256(data.data(), data.size(), digest.data());
    return digest;
}

bool verifySignature(std::span<const std::uint8_t> publicKeyInfo,
                     std::span<const std::uint8_t> publicKeyHash,
                     std::span<const std::uint8_t> challenge,
                     std::span<const std::uint8_t> signature) {
    if (!std::ranges::equal(sha256(publicKeyInfo), publicKeyHash)) return false;
    const QuietErrors quiet;
    const KeyHandle key = readKey(publicKeyInfo);
    const DigestContext context(EVP_MD_CTX_new());
    return key && context &&
           EVP_DigestVerifyInit(context.get(), nullptr, EVP_sha256(), nullptr, key.get()) == 1 &&
           EVP_DigestVerify(context.get(), signature.data(), signature.size(), challenge.data(),
                            challenge.size()) == 1;
}

}  // namespace vlm::service
