#include "card_key.h"

#include <openssl/rsa.h>

#include "services/hints/tokens/signature.h"

namespace vlm::service {
namespace {

KeyHandle makeKey(const std::string& kind) {
    constexpr std::string_view kRsa = "RSA-";
    if (kind == "ED25519") return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, kind.c_str()));
    if (!kind.starts_with(kRsa))
        return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", kind.c_str()));
    const auto bits = std::size_t{std::stoul(kind.substr(kRsa.size()))};
    return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", bits));
}

}  // namespace

CardKey::CardKey(const std::string& kind) : _key(makeKey(kind)) {
    unsigned char* der = nullptr;
    const int size = i2d_PUBKEY(_key.get(), &der);
    _publicInfo.assign(der, der + size);
    OPENSSL_free(der);
}

Bytes CardKey::hash() const { return sha256(_publicInfo); }

std::optional<Secret> CardKey::open(const OpenRequest& request) const {
    const QuietErrors quiet;
    return request.scheme == WrapScheme::Ecdh ? agree(request.sealed) : decrypt(request);
}

std::optional<Secret> CardKey::decrypt(const OpenRequest& request) const {
    const KeyContext context(EVP_PKEY_CTX_new(_key.get(), nullptr));
    const bool oaep = request.scheme == WrapScheme::RsaOaepSha256;
    std::size_t size = request.sealed.size();
    auto opened = Secret::ofSize(size);
    if (EVP_PKEY_decrypt_init(context.get()) != 1 ||
        EVP_PKEY_CTX_set_rsa_padding(context.get(),
                                     oaep ? RSA_PKCS1_OAEP_PADDING : RSA_PKCS1_PADDING) != 1 ||
        (oaep && EVP_PKEY_CTX_set_rsa_oaep_md(context.get(), EVP_sha256()) != 1) ||
        EVP_PKEY_decrypt(context.get(), opened.octets().data(), &size, request.sealed.data(),
                         request.sealed.size()) != 1)
        return {};
    opened.shorten(size);
    return opened;
}

std::optional<Secret> CardKey::agree(const Bytes& point) const {
    const KeyHandle peer(EVP_PKEY_new());
    const KeyContext context(EVP_PKEY_CTX_new(_key.get(), nullptr));
    std::size_t size = 0;
    if (EVP_PKEY_copy_parameters(peer.get(), _key.get()) != 1 ||
        EVP_PKEY_set1_encoded_public_key(peer.get(), point.data(), point.size()) != 1 ||
        EVP_PKEY_derive_init(context.get()) != 1 ||
        EVP_PKEY_derive_set_peer(context.get(), peer.get()) != 1 ||
        EVP_PKEY_derive(context.get(), nullptr, &size) != 1)
        return {};
    auto opened = Secret::ofSize(size);
    if (EVP_PKEY_derive(context.get(), opened.octets().data(), &size) != 1) return {};
    opened.shorten(size);
    return opened;
}

}  // namespace vlm::service
