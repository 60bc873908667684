#include "services/keychain/unlock_key_wrapping.h"

#include <openssl/core_names.h>
#include <openssl/rand.h>

#include <algorithm>
#include <array>
#include <utility>

#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/tokens/signature.h"
#include "services/keychain/sealed_secret.h"
#include "services/keychain/wrapped_form.h"

namespace vlm::service {
namespace {

using Octets = std::span<const std::uint8_t>;

constexpr std::size_t kKeyBytes = 32;
constexpr std::array<std::uint8_t, 14> kKeyLabel = {'v', 'l', 'm', ' ', 'u', 'n', 'l',
                                                    'o', 'c', 'k', ' ', 'k', 'e', 'y'};

// OpenSSL's parameters are for reading here, but have their type in common with those it writes.
OSSL_PARAM octetParameter(const char* name, Octets octets) {
    return OSSL_PARAM_construct_octet_string(name, const_cast<std::uint8_t*>(octets.data()),
                                             octets.size());
}

// The key of the cipher. The sealed part is its salt, which ties it to one ephemeral point.
std::optional<Secret> cipherKey(const Secret& secret, Octets sealed) {
    std::array<char, 7> digest = {"SHA256"};
    const std::array<OSSL_PARAM, 5> parameters = {
        OSSL_PARAM_construct_utf8_string(OSSL_KDF_PARAM_DIGEST, digest.data(), 0),
        octetParameter(OSSL_KDF_PARAM_KEY, secret.octets()),
        octetParameter(OSSL_KDF_PARAM_SALT, sealed), octetParameter(OSSL_KDF_PARAM_INFO, kKeyLabel),
        OSSL_PARAM_construct_end()};
    const KdfHandle hkdf(EVP_KDF_fetch(nullptr, OSSL_KDF_NAME_HKDF, nullptr));
    const KdfContext context(EVP_KDF_CTX_new(hkdf.get()));
    Secret key = Secret::ofSize(kKeyBytes);
    if (!context ||
        EVP_KDF_derive(context.get(), key.octets().data(), kKeyBytes, parameters.data()) != 1)
        return {};
    return key;
}

// A cipher that has taken in what is authenticated along.
CipherContext cipher(Secret& key, Octets nonce, const Bytes& associated, bool encrypts) {
    static_assert(kNonceBytes == 12, "the size that the cipher has by itself");
    CipherContext context(EVP_CIPHER_CTX_new());
    int size = 0;
    if (!context ||
        EVP_CipherInit_ex2(context.get(), EVP_aes_256_gcm(), key.octets().data(), nonce.data(),
                           encrypts ? 1 : 0, nullptr) != 1 ||
        EVP_CipherUpdate(context.get(), nullptr, &size, associated.data(),
                         static_cast<int>(associated.size())) != 1)
        return nullptr;
    return context;
}

Secret padded(const Secret& unlockKey) {
    Secret padded = Secret::ofSize(kPaddedBytes);
    const auto place = padded.memory();
    const std::size_t size = unlockKey.text().size();
    place[0] = static_cast<char>(size >> 8U);
    place[1] = static_cast<char>(size);
    std::ranges::copy(unlockKey.text(), place.begin() + kSizeBytes);
    return padded;
}

std::optional<Secret> withoutPadding(const Secret& padded) {
    const auto octets = padded.octets();
    const std::size_t size = std::size_t{octets[0]} << 8U | octets[1];
    if (size == 0 || size > kMostUnlockKeyBytes) return {};
    return Secret(padded.text().substr(kSizeBytes, size));
}

// The ciphertext and its tag.
std::optional<Bytes> encrypt(Secret& key, Octets nonce, const Bytes& associated, Secret plain) {
    const CipherContext context = cipher(key, nonce, associated, /*encrypts=*/true);
    Bytes made(kPaddedBytes + kTagBytes);
    int size = 0;
    int rest = 0;
    if (!context ||
        EVP_EncryptUpdate(context.get(), made.data(), &size, plain.octets().data(), kPaddedBytes) !=
            1 ||
        EVP_EncryptFinal_ex(context.get(), made.data() + size, &rest) != 1 ||
        size + rest != static_cast<int>(kPaddedBytes) ||
        EVP_CIPHER_CTX_ctrl(context.get(), EVP_CTRL_AEAD_GET_TAG, kTagBytes,
                            made.data() + kPaddedBytes) != 1)
        return {};
    return made;
}

std::optional<Secret> decrypt(Secret& key, const WrappedForm& form, const Bytes& associated) {
    const CipherContext context = cipher(key, form.nonce, associated, /*encrypts=*/false);
    Secret plain = Secret::ofSize(kPaddedBytes);
    Bytes tag(form.tag.begin(), form.tag.end());
    int size = 0;
    int rest = 0;
    if (!context ||
        EVP_DecryptUpdate(context.get(), plain.octets().data(), &size, form.ciphertext.data(),
                          static_cast<int>(form.ciphertext.size())) != 1 ||
        EVP_CIPHER_CTX_ctrl(context.get(), EVP_CTRL_AEAD_SET_TAG, kTagBytes, tag.data()) != 1 ||
        EVP_DecryptFinal_ex(context.get(), plain.octets().data() + size, &rest) != 1)
        return {};
    return plain;
}

}  // namespace

std::optional<Bytes> wrapUnlockKey(const Secret& unlockKey, const UnlockKeyPurpose& purpose,
                                   const Bytes& wrapPublicInfo, WrapScheme scheme) {
    if (unlockKey.empty() || unlockKey.text().size() > kMostUnlockKeyBytes ||
        sha256(wrapPublicInfo) != purpose.wrapKeyHash)
        return {};
    const QuietErrors quiet;
    const auto sealed = sealFreshSecret(wrapPublicInfo, scheme);
    std::array<std::uint8_t, kNonceBytes> nonce{};
    if (!sealed || RAND_bytes(nonce.data(), kNonceBytes) != 1) return {};
    auto wrapped = wrappedFront(scheme, sealed->sealed, nonce);
    auto key = cipherKey(sealed->secret, sealed->sealed);
    if (!wrapped || !key) return {};
    const auto ciphertext =
        encrypt(*key, nonce, associatedData(*wrapped, purpose), padded(unlockKey));
    if (!ciphertext) return {};
    wrapped->insert(wrapped->end(), ciphertext->begin(), ciphertext->end());
    return wrapped;
}

std::optional<OpenRequest> cardTask(std::span<const std::uint8_t> wrapped,
                                    const Bytes& wrapKeyHash) {
    const auto form = readWrappedForm(wrapped);
    if (!form) return {};
    return OpenRequest{wrapKeyHash, form->scheme, Bytes(form->sealed.begin(), form->sealed.end())};
}

std::optional<Secret> unwrapUnlockKey(std::span<const std::uint8_t> wrapped, const Secret& opened,
                                      const UnlockKeyPurpose& purpose) {
    const auto form = readWrappedForm(wrapped);
    if (!form || opened.empty()) return {};
    const QuietErrors quiet;
    auto key = cipherKey(opened, form->sealed);
    if (!key) return {};
    const auto plain = decrypt(*key, *form, associatedData(form->front, purpose));
    if (!plain) return {};
    return withoutPadding(*plain);
}

}  // namespace vlm::service
