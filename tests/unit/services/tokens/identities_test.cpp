#include "services/hints/tokens/identities.h"

#include <gmock/gmock.h>

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::int64_t kNow = 1'000'000;

CertificateObject certificate(const std::string& name, std::uint8_t keyNumber,
                              KeyKind kind = KeyKind::Ec) {
    CertificateObject object;
    object.id = {keyNumber};
    object.label = "label of " + name;
    object.facts.keyKind = kind;
    object.facts.publicKeyHash = Bytes(32, keyNumber);
    object.facts.publicNumber = Bytes(32, keyNumber);
    object.facts.name = name;
    object.facts.notBefore = kNow - 100;
    object.facts.notAfter = kNow + 100;
    object.facts.maySign = object.facts.mayWrap = true;
    object.der = {keyNumber, 99};
    return object;
}

// The key of a certificate, as a token shows it.
KeyObject keyOf(const CertificateObject& certificate, bool isPrivate = false) {
    KeyObject key;
    key.isPrivate = isPrivate;
    key.kind = certificate.facts.keyKind;
    key.id = certificate.id;
    if (key.kind == KeyKind::Ec) {
        key.publicPart = {4, 65, 4};
        key.publicPart.resize(3 + 64, 0xAA);
        std::ranges::copy(certificate.facts.publicNumber, key.publicPart.begin() + 3);
    } else {
        key.publicPart = certificate.facts.publicNumber;
    }
    key.signs = key.wraps = true;
    return key;
}

class AddIdentitiesTest : public testing::Test {
protected:
    AddIdentitiesTest() { objects.wrapMechanisms = {.oaep = true, .pkcs1 = true, .ecdh = true}; }

    void show(const CertificateObject& certificate) { objects.certificates.push_back(certificate); }
    void show(const KeyObject& key) {
        objects.keys.push_back(key);
        objects.showsKeys = true;
    }
    void showWithKey(const CertificateObject& certificate) {
        show(certificate);
        show(keyOf(certificate));
    }
    Token made() {
        Token token;
        token.needsLogin = needsLogin;
        addIdentities(objects, kNow, token);
        return token;
    }
    std::vector<std::string> names() {
        std::vector<std::string> names;
        for (const Identity& identity : made().identities) names.push_back(identity.name);
        return names;
    }

    TokenObjects objects;
    bool needsLogin = true;
};

TEST_F(AddIdentitiesTest, SortsByHashWhateverTheModulesOrder) {
    for (const std::uint8_t number : {3, 1, 2})
        showWithKey(certificate(std::to_string(number), number));

    EXPECT_THAT(names(), ElementsAre("1", "2", "3"));
}

TEST_F(AddIdentitiesTest, TellsTheCertificatesWithAndWithoutAKey) {
    showWithKey(certificate("with", 1));
    show(certificate("without", 2));

    const auto token = made();

    EXPECT_EQ(token.identities.at(0).certificate, (Bytes{1, 99}));
    EXPECT_THAT(token.otherCertificates, ElementsAre(Bytes{2, 99}));
}

TEST_F(AddIdentitiesTest, NeedsAWitnessWhereTheTokenShowsKeys) {
    showWithKey(certificate("with", 1));
    show(certificate("without", 2));

    EXPECT_THAT(names(), ElementsAre("with"));
}

TEST_F(AddIdentitiesTest, BelievesCertificatesWhereAllKeysAreHiddenBehindALogin) {
    show(certificate("believed", 1));
    EXPECT_THAT(names(), ElementsAre("believed"));

    needsLogin = false;
    EXPECT_THAT(names(), IsEmpty()) << "nothing could hide the key";
}

TEST_F(AddIdentitiesTest, NeedsThePrivateKeyItselfWhereNoLoginHidesIt) {
    needsLogin = false;
    showWithKey(certificate("public only", 1));
    EXPECT_THAT(names(), IsEmpty());

    show(keyOf(certificate("public only", 1), /*isPrivate=*/true));
    EXPECT_THAT(names(), ElementsAre("public only"));
}

TEST_F(AddIdentitiesTest, TakesNoWitnessWithAnotherIdOrAnotherKey) {
    const CertificateObject alice = certificate("Alice", 1);
    KeyObject otherId = keyOf(alice);
    otherId.id = {9};
    KeyObject otherKey = keyOf(certificate("Bob", 2));
    otherKey.id = alice.id;
    KeyObject otherKind = keyOf(certificate("Carol", 1, KeyKind::Rsa));
    show(alice);
    show(otherId);
    show(otherKey);
    show(otherKind);

    EXPECT_THAT(names(), IsEmpty());
}

TEST_F(AddIdentitiesTest, TakesTheIdAsItIsWhereTheKeyTellsNothing) {
    const CertificateObject alice = certificate("Alice", 1);
    KeyObject silent = keyOf(alice, /*isPrivate=*/true);
    silent.publicPart.clear();
    show(alice);
    show(silent);

    EXPECT_THAT(names(), ElementsAre("Alice"));
}

TEST_F(AddIdentitiesTest, TakesNoSilentKeyWithoutAnId) {
    CertificateObject alice = certificate("Alice", 1);
    alice.id.clear();
    KeyObject key = keyOf(alice);
    show(alice);
    show(key);
    EXPECT_THAT(names(), ElementsAre("Alice")) << "the key itself is witness enough";

    objects.keys[0].publicPart.clear();
    EXPECT_THAT(names(), IsEmpty());
}

struct Dates {
    const char* why;
    std::int64_t notBefore;
    std::int64_t notAfter;
};

TEST_F(AddIdentitiesTest, LetsTheNewestValidCertificateStandForAKey) {
    // From best to worst; each must win against all that follow, in either order.
    const std::vector<Dates> ranked = {
        {"valid, newest", kNow - 10, kNow + 10},
        {"valid, of the same age and shorter", kNow - 10, kNow + 5},
        {"valid, older, longer", kNow - 20, kNow + 1000},
        {"not yet valid", kNow + 1, kNow + 1000},
        {"expired", kNow - 5, kNow - 1},
    };
    for (std::size_t better = 0; better < ranked.size(); ++better)
        for (std::size_t worse = better + 1; worse < ranked.size(); ++worse)
            for (const bool betterFirst : {true, false}) {
                objects = {};
                for (const auto& dates :
                     {ranked[betterFirst ? better : worse], ranked[betterFirst ? worse : better]}) {
                    CertificateObject one = certificate(dates.why, 1);
                    one.facts.notBefore = dates.notBefore;
                    one.facts.notAfter = dates.notAfter;
                    show(one);
                }
                show(keyOf(certificate("", 1)));
                EXPECT_THAT(names(), ElementsAre(ranked[better].why)) << ranked[worse].why;
            }
}

TEST_F(AddIdentitiesTest, IsCalledByTheLabelWhereTheCertificateHasNoName) {
    CertificateObject nameless = certificate("", 1);
    nameless.label = "the label";
    showWithKey(nameless);

    EXPECT_THAT(names(), ElementsAre("the label"));
}

TEST_F(AddIdentitiesTest, SignsWhereKeyAndCertificateBothAllowIt) {
    for (const bool keyAllows : {true, false})
        for (const bool certificateAllows : {true, false}) {
            objects = {};
            CertificateObject alice = certificate("Alice", 1);
            alice.facts.maySign = certificateAllows;
            KeyObject key = keyOf(alice);
            key.signs = keyAllows;
            show(alice);
            show(key);
            EXPECT_EQ(made().identities[0].canSign, keyAllows && certificateAllows);
        }
}

TEST_F(AddIdentitiesTest, BelievesAPrivateKeyBeforeAPublicOne) {
    const CertificateObject alice = certificate("Alice", 1);
    KeyObject secret = keyOf(alice, /*isPrivate=*/true);
    secret.signs = false;
    showWithKey(alice);
    show(secret);

    EXPECT_FALSE(made().identities[0].canSign);
}

TEST_F(AddIdentitiesTest, WrapsByTheSmallestRsaKeyElseTheSmallestEcKey) {
    showWithKey(certificate("ec", 1));
    showWithKey(certificate("another ec", 2));
    EXPECT_EQ(made().wrapKeyHash, Bytes(32, 1));

    showWithKey(certificate("rsa", 4, KeyKind::Rsa));
    showWithKey(certificate("smaller rsa", 3, KeyKind::Rsa));
    EXPECT_EQ(made().wrapKeyHash, Bytes(32, 3));
}

TEST_F(AddIdentitiesTest, WrapsInTheBestWayThatTheTokenOffers) {
    struct Case {
        const char* why;
        WrapMechanisms mechanisms;
        std::optional<std::uint8_t> key;
        WrapScheme scheme;
    };
    const std::vector<Case> cases = {
        {"everything", {true, true, true}, 2, WrapScheme::RsaOaepSha256},
        {"no ECDH", {true, true, false}, 2, WrapScheme::RsaOaepSha256},
        {"the old padding is the last choice", {false, true, true}, 1, WrapScheme::Ecdh},
        {"and the only one", {false, true, false}, 2, WrapScheme::RsaPkcs1},
        {"ECDH only", {false, false, true}, 1, WrapScheme::Ecdh},
        {"nothing", {false, false, false}, std::nullopt, WrapScheme::RsaOaepSha256},
    };
    showWithKey(certificate("ec", 1));
    showWithKey(certificate("rsa", 2, KeyKind::Rsa));
    for (const Case& each : cases) {
        objects.wrapMechanisms = each.mechanisms;

        const Token token = made();

        const auto expected = each.key ? std::optional(Bytes(32, *each.key)) : std::nullopt;
        EXPECT_EQ(token.wrapKeyHash, expected) << each.why;
        EXPECT_EQ(token.wrapScheme, each.scheme) << each.why;
    }
}

TEST_F(AddIdentitiesTest, WrapsByNoKeyThatOrWhoseCertificateDoesNotAllowIt) {
    CertificateObject alice = certificate("Alice", 1);
    alice.facts.mayWrap = false;
    const CertificateObject bob = certificate("Bob", 2);
    KeyObject key = keyOf(bob);
    key.wraps = false;
    showWithKey(alice);
    show(bob);
    show(key);

    EXPECT_FALSE(made().wrapKeyHash);
}

TEST(SameKeyTest, ReadsPointsInAllTheirForms) {
    CertificateFacts facts;
    facts.keyKind = KeyKind::Ec;
    facts.publicNumber = Bytes(32, 7);
    const auto compare = [&facts](Bytes head, std::size_t size, std::uint8_t fill) {
        KeyObject key;
        key.kind = KeyKind::Ec;
        key.publicPart = std::move(head);
        key.publicPart.resize(key.publicPart.size() + size, fill);
        return sameKey(key, facts);
    };

    EXPECT_EQ(compare({4, 65, 4}, 64, 7), SameKey::Yes) << "in an octet string";
    EXPECT_EQ(compare({4}, 64, 7), SameKey::Yes) << "bare";
    EXPECT_EQ(compare({4, 33, 2}, 32, 7), SameKey::Yes) << "compressed";
    EXPECT_EQ(compare({3}, 32, 7), SameKey::Yes) << "compressed, bare";
    EXPECT_EQ(compare({4, 65, 4}, 64, 8), SameKey::No) << "another point";
    EXPECT_EQ(compare({4, 97, 4}, 96, 7), SameKey::No) << "another curve";
    EXPECT_EQ(compare({4}, 0, 7), SameKey::No) << "cut";
    EXPECT_EQ(compare({}, 0, 7), SameKey::Untold);
}

TEST(SameKeyTest, ComparesModuliWithoutZerosInFront) {
    CertificateFacts facts;
    facts.keyKind = KeyKind::Rsa;
    facts.publicNumber = {0xC0, 1};
    KeyObject key;
    key.publicPart = {0, 0xC0, 1};

    EXPECT_EQ(sameKey(key, facts), SameKey::Yes);
    key.publicPart = {0, 0};
    EXPECT_EQ(sameKey(key, facts), SameKey::No);
}

}  // namespace
}  // namespace vlm::service
