#include "services/keychain/sealed_secret.h"

#include <openssl/rand.h>
#include <openssl/rsa.h>

#include <array>
#include <utility>

#include "services/hints/tokens/key_strength.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {
namespace {

// The key, when nobody but its holder can undo what is done with it.
KeyHandle soundKey(std::span<const std::uint8_t> der, WrapScheme scheme) {
    const unsigned char* end = der.data();
    KeyHandle key(d2i_PUBKEY(nullptr, &end, static_cast<long>(der.size())));
    if (!key || end != der.data() + der.size()) return nullptr;
    const bool ec = scheme == WrapScheme::Ecdh;
    if (EVP_PKEY_get_base_id(key.get()) != (ec ? EVP_PKEY_EC : EVP_PKEY_RSA) ||
        EVP_PKEY_get_bits(key.get()) < (ec ? kSmallestCurve : kSmallestRsaKey))
        return nullptr;
    const KeyContext context(EVP_PKEY_CTX_new(key.get(), nullptr));
    if (!context || EVP_PKEY_public_check(context.get()) != 1) return nullptr;
    return key;
}

bool setPadding(EVP_PKEY_CTX* context, WrapScheme scheme) {
    if (scheme == WrapScheme::RsaPkcs1)
        return EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PADDING) == 1;
    return EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_OAEP_PADDING) == 1 &&
           EVP_PKEY_CTX_set_rsa_oaep_md(context, EVP_sha256()) == 1 &&
           EVP_PKEY_CTX_set_rsa_mgf1_md(context, EVP_sha256()) == 1;
}

std::optional<SealedSecret> encryptRandom(EVP_PKEY* key, WrapScheme scheme) {
    SealedSecret made{Secret::ofSize(kSealedRandomBytes), {}};
    const KeyContext context(EVP_PKEY_CTX_new(key, nullptr));
    if (!context || RAND_priv_bytes(made.secret.octets().data(), kSealedRandomBytes) != 1 ||
        EVP_PKEY_encrypt_init(context.get()) != 1 || !setPadding(context.get(), scheme))
        return {};
    std::size_t size = static_cast<std::size_t>(EVP_PKEY_get_size(key));
    made.sealed.resize(size);
    if (EVP_PKEY_encrypt(context.get(), made.sealed.data(), &size, made.secret.octets().data(),
                         kSealedRandomBytes) != 1)
        return {};
    made.sealed.resize(size);
    return made;
}

// On the curve of the key; none for a curve without a name, which a card could not tell either.
KeyHandle ephemeralFor(const EVP_PKEY* key) {
    std::array<char, 64> curve{};
    if (EVP_PKEY_get_group_name(key, curve.data(), curve.size(), nullptr) != 1) return nullptr;
    return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve.data()));
}

Bytes pointOf(EVP_PKEY* key) {
    unsigned char* point = nullptr;
    const std::size_t size = EVP_PKEY_get1_encoded_public_key(key, &point);
    Bytes bytes(point, point + size);
    OPENSSL_free(point);
    return bytes;
}

std::optional<SealedSecret> agreeWith(EVP_PKEY* key) {
    const KeyHandle ephemeral = ephemeralFor(key);
    if (!ephemeral) return {};
    const KeyContext context(EVP_PKEY_CTX_new(ephemeral.get(), nullptr));
    std::size_t size = 0;
    if (!context || EVP_PKEY_derive_init(context.get()) != 1 ||
        EVP_PKEY_derive_set_peer(context.get(), key) != 1 ||
        EVP_PKEY_derive(context.get(), nullptr, &size) != 1)
        return {};
    SealedSecret made{Secret::ofSize(size), pointOf(ephemeral.get())};
    if (EVP_PKEY_derive(context.get(), made.secret.octets().data(), &size) != 1) return {};
    made.secret.shorten(size);
    return made;
}

}  // namespace

std::optional<SealedSecret> sealFreshSecret(std::span<const std::uint8_t> publicKeyInfo,
                                            WrapScheme scheme) {
    const QuietErrors quiet;
    const KeyHandle key = soundKey(publicKeyInfo, scheme);
    if (!key) return {};
    return scheme == WrapScheme::Ecdh ? agreeWith(key.get()) : encryptRandom(key.get(), scheme);
}

}  // namespace vlm::service
