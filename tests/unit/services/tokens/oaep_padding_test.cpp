#include "services/hints/tokens/oaep_padding.h"

#include <gtest/gtest.h>
#include <openssl/rsa.h>

#include <string>

#include "platform/types.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {
namespace {

using platform::Bytes;

constexpr std::size_t kModulusBytes = 256;

const KeyHandle& key() {
    static const KeyHandle kKey(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", kModulusBytes * 8));
    return kKey;
}

// What the bare operation makes of the text, padded with that digest.
Secret paddedBlock(const std::string& text, const EVP_MD* digest = EVP_sha256()) {
    const auto* octets = reinterpret_cast<const unsigned char*>(text.data());
    Bytes sealed(kModulusBytes);
    std::size_t size = sealed.size();
    const KeyContext encrypts(EVP_PKEY_CTX_new(key().get(), nullptr));
    EXPECT_EQ(EVP_PKEY_encrypt_init(encrypts.get()), 1);
    EXPECT_EQ(EVP_PKEY_CTX_set_rsa_padding(encrypts.get(), RSA_PKCS1_OAEP_PADDING), 1);
    EXPECT_EQ(EVP_PKEY_CTX_set_rsa_oaep_md(encrypts.get(), digest), 1);
    EXPECT_EQ(EVP_PKEY_encrypt(encrypts.get(), sealed.data(), &size, octets, text.size()), 1);

    auto block = Secret::ofSize(kModulusBytes);
    const KeyContext decrypts(EVP_PKEY_CTX_new(key().get(), nullptr));
    EXPECT_EQ(EVP_PKEY_decrypt_init(decrypts.get()), 1);
    EXPECT_EQ(EVP_PKEY_CTX_set_rsa_padding(decrypts.get(), RSA_NO_PADDING), 1);
    EXPECT_EQ(EVP_PKEY_decrypt(decrypts.get(), block.octets().data(), &size, sealed.data(),
                               sealed.size()),
              1);
    return block;
}

TEST(OaepPaddingTest, IsTakenOff) {
    for (const std::string& text : {std::string(), std::string("x"), std::string(32, '\0'),
                                    std::string(kModulusBytes - 66, 'y')}) {
        const auto content = withoutOaepPadding(paddedBlock(text), kModulusBytes);
        ASSERT_TRUE(content);
        EXPECT_EQ(content->text(), text);
    }
}

TEST(OaepPaddingTest, IsNotThereAfterAnyChange) {
    auto block = paddedBlock("secret");
    for (std::size_t i = 0; i < kModulusBytes; ++i) {
        block.octets()[i] ^= 1U;
        EXPECT_FALSE(withoutOaepPadding(block, kModulusBytes)) << "byte " << i;
        block.octets()[i] ^= 1U;
    }
    EXPECT_TRUE(withoutOaepPadding(block, kModulusBytes));
}

TEST(OaepPaddingTest, OfAnotherKindOrSizeIsRefused) {
    EXPECT_FALSE(withoutOaepPadding(paddedBlock("secret", EVP_sha1()), kModulusBytes));
    EXPECT_FALSE(withoutOaepPadding(Secret::ofSize(kModulusBytes), kModulusBytes));
    EXPECT_FALSE(withoutOaepPadding(paddedBlock("secret"), kModulusBytes - 1));
    EXPECT_FALSE(withoutOaepPadding(Secret(), kModulusBytes));
    EXPECT_FALSE(withoutOaepPadding(Secret("x"), 1));
    EXPECT_EQ(ERR_peek_error(), 0U);
}

}  // namespace
}  // namespace vlm::service
