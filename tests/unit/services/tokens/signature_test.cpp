#include "services/hints/tokens/signature.h"

#include <gtest/gtest.h>

#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/tokens/raw_signature.h"

namespace vlm::service {
namespace {

const Bytes kChallenge(32, 0x11);

// Made once: it takes its time.
const KeyHandle& rsaKey() {
    static const KeyHandle kKey(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", std::size_t{2048}));
    return kKey;
}
KeyHandle makeEc(const char* curve) {
    return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve));
}

Bytes publicKeyInfoOf(const KeyHandle& key) {
    unsigned char* der = nullptr;
    const int size = i2d_PUBKEY(key.get(), &der);
    Bytes info(der, der + size);
    OPENSSL_free(der);
    return info;
}

Bytes sign(const KeyHandle& key, const EVP_MD* digest = EVP_sha256()) {
    const DigestContext context(EVP_MD_CTX_new());
    std::size_t size = 0;
    EVP_DigestSignInit(context.get(), nullptr, digest, nullptr, key.get());
    EVP_DigestSign(context.get(), nullptr, &size, kChallenge.data(), kChallenge.size());
    Bytes signature(size);
    EVP_DigestSign(context.get(), signature.data(), &size, kChallenge.data(), kChallenge.size());
    signature.resize(size);
    return signature;
}

// A key with a good signature, of which one thing at a time is spoilt.
struct Sample {
    explicit Sample(const KeyHandle& key)
        : info(publicKeyInfoOf(key)), hash(sha256(info)), signature(sign(key)) {}
    bool verifies() const { return verifySignature(info, hash, challenge, signature); }

    Bytes info;
    Bytes hash;
    Bytes challenge = kChallenge;
    Bytes signature;
};

class VerifySignatureTest : public testing::Test {
protected:
    void TearDown() override { EXPECT_EQ(ERR_peek_error(), 0U) << "an error was left behind"; }
};

TEST_F(VerifySignatureTest, TakesGoodOnesOfRsaAndEc) {
    EXPECT_TRUE(Sample(rsaKey()).verifies());
    EXPECT_TRUE(Sample(makeEc("P-256")).verifies());
    EXPECT_TRUE(Sample(makeEc("P-384")).verifies());
}

TEST_F(VerifySignatureTest, RefusesAnotherChallenge) {
    for (Sample sample : {Sample(rsaKey()), Sample(makeEc("P-256"))}) {
        sample.challenge[0] ^= 1U;
        EXPECT_FALSE(sample.verifies());
    }
}

TEST_F(VerifySignatureTest, RefusesAChangedSignature) {
    for (Sample sample : {Sample(rsaKey()), Sample(makeEc("P-256"))}) {
        sample.signature.back() ^= 1U;
        EXPECT_FALSE(sample.verifies());
        sample.signature.clear();
        EXPECT_FALSE(sample.verifies());
    }
}

TEST_F(VerifySignatureTest, RefusesAnotherKeyThanTheOneAskedFor) {
    Sample sample(makeEc("P-256"));
    const Sample other(makeEc("P-256"));
    sample.hash = other.hash;
    EXPECT_FALSE(sample.verifies()) << "the key shown does not have the hash";
    sample.info = other.info;
    EXPECT_FALSE(sample.verifies()) << "the signature is another key's";
    sample.hash.clear();
    EXPECT_FALSE(sample.verifies());
}

TEST_F(VerifySignatureTest, RefusesAnRsaKeyThatIsTooSmall) {
    const KeyHandle small(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", std::size_t{1024}));
    EXPECT_FALSE(Sample(small).verifies());
}

TEST_F(VerifySignatureTest, RefusesAnotherDigest) {
    const KeyHandle& key = rsaKey();
    Sample sample(key);
    sample.signature = sign(key, EVP_sha1());

    EXPECT_FALSE(sample.verifies());
}

TEST_F(VerifySignatureTest, RefusesKeysThatAreNone) {
    Sample sample(makeEc("P-256"));
    for (const Bytes& info : {Bytes{}, Bytes{0x30, 0x00}, Bytes(100, 0xFF)}) {
        sample.info = info;
        sample.hash = sha256(info);
        EXPECT_FALSE(sample.verifies());
    }
}

TEST_F(VerifySignatureTest, RefusesAKeyWithSomethingBehindIt) {
    Sample sample(makeEc("P-256"));
    sample.info.push_back(0);
    sample.hash = sha256(sample.info);

    EXPECT_FALSE(sample.verifies());
}

TEST_F(VerifySignatureTest, RefusesKeysOfOtherKinds) {
    const KeyHandle key(EVP_PKEY_Q_keygen(nullptr, nullptr, "ED25519"));
    Sample sample(makeEc("P-256"));
    sample.info = publicKeyInfoOf(key);
    sample.hash = sha256(sample.info);

    EXPECT_FALSE(sample.verifies());
}

TEST(RawSignatureTest, OfEcBecomesDer) {
    const Bytes numbers = {0x80, 0x01, 0x00, 0x7F};

    EXPECT_EQ(ecdsaSignatureDer(numbers),
              (Bytes{0x30, 0x08, 0x02, 0x03, 0x00, 0x80, 0x01, 0x02, 0x01, 0x7F}));
}

TEST(RawSignatureTest, OfUnevenLengthIsNone) {
    EXPECT_EQ(ecdsaSignatureDer(Bytes{}), Bytes{});
    EXPECT_EQ(ecdsaSignatureDer(Bytes{1}), Bytes{});
    EXPECT_EQ(ecdsaSignatureDer(Bytes{1, 2, 3}), Bytes{});
}

TEST(RawSignatureTest, InputIsTheDigestAsTheKeyTakesIt) {
    CertificateFacts rsa;
    CertificateFacts p256;
    p256.keyKind = KeyKind::Ec;
    p256.publicNumber = Bytes(32, 1);
    CertificateFacts p224 = p256;
    p224.publicNumber = Bytes(28, 1);

    EXPECT_EQ(signatureInput(rsa, kChallenge).size(), 51U);
    EXPECT_EQ(signatureInput(p256, kChallenge), sha256(kChallenge));
    EXPECT_EQ(signatureInput(p224, kChallenge).size(), 28U);
}

}  // namespace
}  // namespace vlm::service
