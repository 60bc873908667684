#include "services/keychain/unlock_key_wrapping.h"

#include <gtest/gtest.h>

#include <array>
#include <map>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include "card_key.h"
#include "services/hints/tokens/signature.h"
#include "services/keychain/wrapped_form.h"

namespace vlm::service {
namespace {

const std::string kPassword = "correct horse";

// Keys cost time to make, and nothing is ever changed in one.
const CardKey& keyCalled(const std::string& kind) {
    static std::map<std::string, CardKey> keys;
    return keys.try_emplace(kind, kind).first->second;
}

UnlockKeyPurpose purposeOf(const CardKey& key) { return {"alice", Bytes(32, 7), key.hash()}; }

struct KeyAndScheme {
    const char* key;
    WrapScheme scheme;
};

// What the test is listed as.
void PrintTo(const KeyAndScheme& row, std::ostream* stream) {
    *stream << row.key << (row.scheme == WrapScheme::RsaPkcs1 ? ", PKCS#1 v1.5" : "");
}

// A password that was wrapped, and what the card makes of it.
struct Wrapped {
    explicit Wrapped(const KeyAndScheme& row, const std::string& password = kPassword)
        : key(keyCalled(row.key)), purpose(purposeOf(key)) {
        form = wrapUnlockKey(Secret(password), purpose, key.publicInfo(), row.scheme)
                   .value_or(Bytes{});
        const auto task = cardTask(form, key.hash());
        if (!task) return;
        EXPECT_EQ(task->scheme, row.scheme);
        EXPECT_EQ(task->wrapKeyHash, key.hash());
        if (auto made = key.open(*task)) opened = std::move(*made);
    }

    std::optional<std::string> unwrap(std::span<const std::uint8_t> changed,
                                      const UnlockKeyPurpose& forWhat) const {
        const auto secret = unwrapUnlockKey(changed, opened, forWhat);
        if (!secret) return {};
        return std::string(secret->text());
    }
    std::optional<std::string> unwrap(std::span<const std::uint8_t> changed) const {
        return unwrap(changed, purpose);
    }

    const CardKey& key;
    UnlockKeyPurpose purpose;
    Bytes form;
    Secret opened;
};

constexpr KeyAndScheme kOaep = {"RSA-2048", WrapScheme::RsaOaepSha256};
constexpr KeyAndScheme kPkcs1 = {"RSA-2048", WrapScheme::RsaPkcs1};
constexpr KeyAndScheme kEcdh = {"P-256", WrapScheme::Ecdh};

class EachKeyTest : public testing::TestWithParam<KeyAndScheme> {};

TEST_P(EachKeyTest, OpensWhatWasWrappedForIt) {
    const Wrapped wrapped(GetParam());

    EXPECT_EQ(wrapped.unwrap(wrapped.form), kPassword);
}

INSTANTIATE_TEST_SUITE_P(All, EachKeyTest,
                         testing::Values(kOaep, KeyAndScheme{"RSA-3072", WrapScheme::RsaOaepSha256},
                                         KeyAndScheme{"RSA-4096", WrapScheme::RsaOaepSha256},
                                         kPkcs1, KeyAndScheme{"RSA-4096", WrapScheme::RsaPkcs1},
                                         kEcdh, KeyAndScheme{"P-224", WrapScheme::Ecdh},
                                         KeyAndScheme{"P-384", WrapScheme::Ecdh},
                                         KeyAndScheme{"P-521", WrapScheme::Ecdh},
                                         KeyAndScheme{"brainpoolP256r1", WrapScheme::Ecdh},
                                         KeyAndScheme{"secp256k1", WrapScheme::Ecdh},
                                         KeyAndScheme{"sect409k1", WrapScheme::Ecdh}));

class EachSchemeTest : public testing::TestWithParam<KeyAndScheme> {
protected:
    const Wrapped wrapped{GetParam()};
};

TEST_P(EachSchemeTest, RefusesEachSingleBitThatWasFlipped) {
    ASSERT_EQ(wrapped.unwrap(wrapped.form), kPassword);
    Bytes changed = wrapped.form;
    for (std::size_t bit = 0; bit < changed.size() * 8; ++bit) {
        const auto mask = static_cast<std::uint8_t>(1U << bit % 8);
        changed[bit / 8] ^= mask;
        ASSERT_EQ(wrapped.unwrap(changed), std::nullopt) << "bit " << bit;
        changed[bit / 8] ^= mask;
    }
}

TEST_P(EachSchemeTest, RefusesToBeMovedToAnotherPurpose) {
    for (const std::string account : {"bob", "alic", "alicf", "alice ", ""}) {
        auto other = wrapped.purpose;
        other.account = account;
        EXPECT_EQ(wrapped.unwrap(wrapped.form, other), std::nullopt) << account;
    }
    auto otherHash = wrapped.purpose;
    otherHash.publicKeyHash.front() ^= 1U;
    auto otherWrapKey = wrapped.purpose;
    otherWrapKey.wrapKeyHash.back() ^= 1U;
    auto exchanged = wrapped.purpose;
    std::swap(exchanged.publicKeyHash, exchanged.wrapKeyHash);

    EXPECT_EQ(wrapped.unwrap(wrapped.form, otherHash), std::nullopt);
    EXPECT_EQ(wrapped.unwrap(wrapped.form, otherWrapKey), std::nullopt);
    EXPECT_EQ(wrapped.unwrap(wrapped.form, exchanged), std::nullopt);
}

TEST_P(EachSchemeTest, LetsNoByteGoOverABorderOfItsPurpose) {
    auto shifted = wrapped.purpose;
    shifted.account.pop_back();
    shifted.publicKeyHash.insert(shifted.publicKeyHash.begin(), 'e');
    auto shiftedFurther = wrapped.purpose;
    shiftedFurther.wrapKeyHash.insert(shiftedFurther.wrapKeyHash.begin(),
                                      shiftedFurther.publicKeyHash.back());
    shiftedFurther.publicKeyHash.pop_back();

    EXPECT_EQ(wrapped.unwrap(wrapped.form, shifted), std::nullopt);
    EXPECT_EQ(wrapped.unwrap(wrapped.form, shiftedFurther), std::nullopt);
}

TEST_P(EachSchemeTest, RefusesEachLengthThatIsNotItsOwn) {
    for (std::size_t size = 0; size < wrapped.form.size(); ++size) {
        const auto cut = std::span(wrapped.form).first(size);
        ASSERT_EQ(wrapped.unwrap(cut), std::nullopt) << size << " bytes";
        ASSERT_FALSE(cardTask(cut, wrapped.key.hash())) << size << " bytes";
    }
    Bytes longer = wrapped.form;
    for (const std::size_t more : {1, 16, 256, 8192}) {
        longer.resize(wrapped.form.size() + more);
        EXPECT_EQ(wrapped.unwrap(longer), std::nullopt) << more << " bytes more";
        EXPECT_FALSE(cardTask(longer, wrapped.key.hash())) << more << " bytes more";
    }
}

TEST_P(EachSchemeTest, RefusesAnotherMagicVersionAndScheme) {
    constexpr std::size_t kVersionAt = 4;
    constexpr std::size_t kSchemeAt = 5;
    const std::vector<std::pair<std::size_t, std::uint8_t>> cases = {
        {0, 'v'},       {kVersionAt, 0}, {kVersionAt, 2}, {kVersionAt, 99},
        {kSchemeAt, 0}, {kSchemeAt, 4},  {kSchemeAt, 255}};
    for (const auto& [place, value] : cases) {
        Bytes changed = wrapped.form;
        changed[place] = value;
        EXPECT_FALSE(cardTask(changed, wrapped.key.hash())) << place << ": " << int{value};
        EXPECT_EQ(wrapped.unwrap(changed), std::nullopt) << place << ": " << int{value};
    }
}

TEST_P(EachSchemeTest, NeedsWhatTheCardOpened) {
    Secret nearly(wrapped.opened.text());
    nearly.octets().back() ^= 1U;

    EXPECT_FALSE(unwrapUnlockKey(wrapped.form, nearly, wrapped.purpose));
    EXPECT_FALSE(unwrapUnlockKey(wrapped.form, Secret(), wrapped.purpose));
}

TEST_P(EachSchemeTest, WrapsEachTimeAnew) {
    const Wrapped again(GetParam());

    EXPECT_NE(again.form, wrapped.form);
    EXPECT_NE(again.opened.text(), wrapped.opened.text());
    EXPECT_EQ(wrapped.unwrap(again.form), std::nullopt);
}

TEST_P(EachSchemeTest, CarriesEachPasswordWithoutTellingItsLength) {
    const std::vector<std::string> passwords = {
        "x",
        std::string(kMostUnlockKeyBytes, 'y'),
        std::string("\0a\0", 3),
        std::string(5, '\0'),
        "\xFF\xFE\x80 no UTF-8",
        "пароль 密码",
    };
    for (const std::string& password : passwords) {
        const Wrapped other(GetParam(), password);
        EXPECT_EQ(other.unwrap(other.form), password);
        EXPECT_EQ(other.form.size(), wrapped.form.size());
    }
}

TEST_P(EachSchemeTest, RefusesAPasswordThatIsEmptyOrTooLong) {
    EXPECT_EQ(Wrapped(GetParam(), "").form, Bytes{});
    EXPECT_EQ(Wrapped(GetParam(), std::string(kMostUnlockKeyBytes + 1, 'y')).form, Bytes{});
}

INSTANTIATE_TEST_SUITE_P(All, EachSchemeTest, testing::Values(kOaep, kPkcs1, kEcdh));

std::optional<Bytes> wrapFor(const Bytes& publicInfo, const Bytes& hash, WrapScheme scheme) {
    return wrapUnlockKey(Secret(kPassword), {"alice", Bytes(32, 7), hash}, publicInfo, scheme);
}

TEST(WrapUnlockKeyTest, RefusesKeysThatAreTooWeak) {
    for (const KeyAndScheme& row :
         {KeyAndScheme{"RSA-1024", WrapScheme::RsaOaepSha256},
          KeyAndScheme{"RSA-1024", WrapScheme::RsaPkcs1},
          KeyAndScheme{"RSA-2047", WrapScheme::RsaOaepSha256},
          KeyAndScheme{"P-192", WrapScheme::Ecdh}, KeyAndScheme{"secp112r1", WrapScheme::Ecdh}}) {
        const CardKey key(row.key);
        EXPECT_FALSE(wrapFor(key.publicInfo(), key.hash(), row.scheme)) << row.key;
    }
}

TEST(WrapUnlockKeyTest, RefusesAKeyThatIsNotForTheScheme) {
    const CardKey& rsa = keyCalled("RSA-2048");
    const CardKey& ec = keyCalled("P-256");
    const CardKey& other = keyCalled("ED25519");

    EXPECT_FALSE(wrapFor(rsa.publicInfo(), rsa.hash(), WrapScheme::Ecdh));
    EXPECT_FALSE(wrapFor(ec.publicInfo(), ec.hash(), WrapScheme::RsaOaepSha256));
    EXPECT_FALSE(wrapFor(ec.publicInfo(), ec.hash(), WrapScheme::RsaPkcs1));
    EXPECT_FALSE(wrapFor(other.publicInfo(), other.hash(), WrapScheme::Ecdh));
    EXPECT_FALSE(wrapFor(other.publicInfo(), other.hash(), WrapScheme::RsaOaepSha256));
}

TEST(WrapUnlockKeyTest, RefusesAKeyThatHasNotTheHash) {
    const CardKey& key = keyCalled("P-256");

    EXPECT_TRUE(wrapFor(key.publicInfo(), key.hash(), WrapScheme::Ecdh));
    EXPECT_FALSE(wrapFor(key.publicInfo(), Bytes(32, 9), WrapScheme::Ecdh));
    EXPECT_FALSE(wrapFor(key.publicInfo(), {}, WrapScheme::Ecdh));
}

TEST(WrapUnlockKeyTest, RefusesWhatIsNoSoundKey) {
    const CardKey& key = keyCalled("P-256");
    Bytes offTheCurve = key.publicInfo();
    offTheCurve.back() ^= 1U;
    Bytes longer = key.publicInfo();
    longer.push_back(0);

    for (const Bytes& bytes : {offTheCurve, longer, Bytes{}, Bytes(91, 0x30)})
        EXPECT_FALSE(wrapFor(bytes, sha256(bytes), WrapScheme::Ecdh));
}

TEST(WrapUnlockKeyTest, LeavesNothingInTheErrorQueue) {
    const Wrapped wrapped(kEcdh);
    ERR_clear_error();

    wrapFor(Bytes(91, 0x30), sha256(Bytes(91, 0x30)), WrapScheme::Ecdh);
    unwrapUnlockKey(wrapped.form, Secret("wrong"), wrapped.purpose);

    EXPECT_EQ(ERR_peek_error(), 0U);
}

// What the card is given is all that an attacker can choose before anything is authenticated.
TEST(CardTaskTest, IsNoneForASealedPartThatNoKeyMakes) {
    struct Case {
        const char* why;
        WrapScheme scheme;
        Bytes sealed;
    };
    Bytes compressed(33, 1);
    compressed.front() = 2;
    Bytes point(65, 1);
    point.front() = 4;
    const std::vector<Case> cases = {
        {"nothing", WrapScheme::RsaOaepSha256, {}},
        {"less than the smallest RSA key makes", WrapScheme::RsaOaepSha256, Bytes(255)},
        {"a point for RSA", WrapScheme::RsaPkcs1, point},
        {"no point", WrapScheme::Ecdh, {}},
        {"the mark of a point only", WrapScheme::Ecdh, {4}},
        {"a compressed point", WrapScheme::Ecdh, compressed},
        {"a point with half a byte too much", WrapScheme::Ecdh, Bytes(66, 4)},
        {"more than a stored form holds", WrapScheme::RsaOaepSha256, Bytes(8192)},
    };
    const std::array<std::uint8_t, kNonceBytes> nonce{};
    ASSERT_TRUE(wrappedFront(WrapScheme::Ecdh, point, nonce));
    for (const Case& each : cases)
        EXPECT_FALSE(wrappedFront(each.scheme, each.sealed, nonce)) << each.why;

    // The same by hand, for the reader.
    for (const Case& each : cases) {
        Bytes form = {'V', 'L', 'M', 'K', 1, static_cast<std::uint8_t>(each.scheme)};
        form.push_back(static_cast<std::uint8_t>(each.sealed.size() >> 8U));
        form.push_back(static_cast<std::uint8_t>(each.sealed.size()));
        form.insert(form.end(), each.sealed.begin(), each.sealed.end());
        form.resize(form.size() + kNonceBytes + kPaddedBytes + kTagBytes);
        EXPECT_FALSE(cardTask(form, Bytes(32, 1))) << each.why;
    }
}

}  // namespace
}  // namespace vlm::service
