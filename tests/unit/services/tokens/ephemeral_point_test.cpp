#include "services/hints/tokens/ephemeral_point.h"

#include <gtest/gtest.h>

#include "platform/types.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {
namespace {

using platform::Bytes;

KeyHandle keyOn(const char* curve) {
    return KeyHandle(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve));
}

Bytes publicInfoOf(const KeyHandle& key) {
    unsigned char* der = nullptr;
    const int size = i2d_PUBKEY(key.get(), &der);
    Bytes bytes(der, der + size);
    OPENSSL_free(der);
    return bytes;
}

Bytes pointOf(const KeyHandle& key) {
    unsigned char* point = nullptr;
    const std::size_t size = EVP_PKEY_get1_encoded_public_key(key.get(), &point);
    Bytes bytes(point, point + size);
    OPENSSL_free(point);
    return bytes;
}

class EachCurveTest : public testing::TestWithParam<const char*> {};

TEST_P(EachCurveTest, TakesItsPoints) {
    const Bytes card = publicInfoOf(keyOn(GetParam()));

    for (int i = 0; i < 4; ++i) EXPECT_TRUE(isPointForKey(pointOf(keyOn(GetParam())), card));
}

TEST_P(EachCurveTest, RefusesWhatIsNoneOfItsPoints) {
    const Bytes card = publicInfoOf(keyOn(GetParam()));
    const Bytes point = pointOf(keyOn(GetParam()));
    Bytes compressed(point.begin(), point.begin() + static_cast<std::ptrdiff_t>(point.size() / 2));
    compressed.push_back(point[point.size() / 2]);
    compressed.front() = static_cast<std::uint8_t>(2 + (point.back() & 1U));
    Bytes hybrid = point;
    hybrid.front() = static_cast<std::uint8_t>(6 + (point.back() & 1U));
    Bytes off = point;
    off.back() ^= 1U;
    Bytes longer = point;
    longer.push_back(0);
    const Bytes shorter(point.begin(), point.end() - 1);

    for (const Bytes& each : {compressed, hybrid, off, longer, shorter, Bytes{}, Bytes{0}, Bytes{4},
                              pointOf(keyOn("secp224r1"))})
        EXPECT_FALSE(isPointForKey(each, card)) << each.size() << " bytes";
    EXPECT_EQ(ERR_peek_error(), 0U);
}

INSTANTIATE_TEST_SUITE_P(All, EachCurveTest,
                         testing::Values("P-256", "P-384", "P-521", "brainpoolP256r1"));

TEST(EphemeralPointTest, IsForEcKeysOnly) {
    const KeyHandle rsa(EVP_PKEY_Q_keygen(nullptr, nullptr, "RSA", std::size_t{2048}));
    const Bytes point = pointOf(keyOn("P-256"));

    EXPECT_FALSE(isPointForKey(point, publicInfoOf(rsa)));
    EXPECT_FALSE(isPointForKey(point, Bytes(91, 0x30)));
    EXPECT_FALSE(isPointForKey(point, {}));
}

}  // namespace
}  // namespace vlm::service
