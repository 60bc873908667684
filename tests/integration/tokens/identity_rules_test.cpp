// Which certificates are identities, and what they are called, on real software cards.

#include <gmock/gmock.h>

#include <algorithm>
#include <ctime>

#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class IdentityRulesTest : public TokensTest {
protected:
    // The only card, with these identities on it.
    Token tokenWith(std::vector<CardIdentity> identities) {
        cards.add("card", std::move(identities));
        return tokenCalled("card");
    }
};

// A certificate whose key is not on the card.
CardIdentity certificateOnly(const std::string& name) {
    CardIdentity alone = identity("p256", name);
    alone.privateKey = alone.publicKey = false;
    return alone;
}

CardIdentity keyOnly() {
    CardIdentity alone = identity("p256", "");
    alone.certificates.clear();
    return alone;
}

CardIdentity withHiddenPublicKey(CardIdentity identity) {
    identity.publicKeyHidden = true;
    return identity;
}

TEST_F(IdentityRulesTest, AKeyWithoutACertificateIsNone) {
    EXPECT_THAT(namesOf(tokenWith({keyOnly(), identity("p256", "Alice")}).identities),
                ElementsAre("Alice"));
}

TEST_F(IdentityRulesTest, ACertificateWithoutAKeyIsNone) {
    EXPECT_THAT(namesOf(tokenWith({certificateOnly("CA"), identity("p256", "Alice")}).identities),
                ElementsAre("Alice"));
}

TEST_F(IdentityRulesTest, ACertificateIsBelievedWhereAllKeysAreHidden) {
    const Token token = tokenWith({withHiddenPublicKey(identity("p256", "Alice")),
                                   withHiddenPublicKey(identity("rsa2048", "Bob"))});

    EXPECT_THAT(namesOf(token.identities), ElementsAre("Alice", "Bob"));
    EXPECT_TRUE(token.wrapKeyHash);
}

TEST_F(IdentityRulesTest, ACertificateOfAnotherKeyWithTheSameIdIsNone) {
    CardIdentity strange = certificateOnly("Stranger");
    CardIdentity alice = identity("p256", "Alice");
    strange.id = alice.id = "07";

    EXPECT_THAT(namesOf(tokenWith({strange, alice}).identities), ElementsAre("Alice"));
}

TEST_F(IdentityRulesTest, OneIdMayServeTwoKeys) {
    CardIdentity alice = identity("p256", "Alice");
    CardIdentity bob = identity("p256", "Bob");
    CardIdentity carol = identity("rsa2048", "Carol");
    alice.id = bob.id = carol.id = "07";

    EXPECT_THAT(namesOf(tokenWith({alice, bob, carol}).identities),
                ElementsAre("Alice", "Bob", "Carol"));
}

TEST_F(IdentityRulesTest, OfTwoCertificatesOnOneKeyTheNewestValidOneStandsForIt) {
    CardIdentity one = identity("p256", "Expired");
    one.certificates = {{.commonName = "Expired", .fromDay = -1, .untilDay = 0},
                        {.commonName = "Older", .fromDay = -20},
                        {.commonName = "Newest", .fromDay = -10},
                        {.commonName = "Not yet valid", .fromDay = 1}};
    one.certificates[0].fromDay = -5;
    one.certificates[0].untilDay = -1;

    EXPECT_THAT(namesOf(tokenWith({one}).identities), ElementsAre("Newest"));
}

TEST_F(IdentityRulesTest, AnExpiredCertificateIsListedWithItsDates) {
    CardIdentity old = identity("p256", "Old");
    old.certificates[0].fromDay = -20;
    old.certificates[0].untilDay = -10;

    const Token token = tokenWith({old});

    ASSERT_THAT(token.identities, SizeIs(1));
    const std::int64_t now = std::time(nullptr);
    EXPECT_NEAR(static_cast<double>(token.identities[0].notBefore),
                static_cast<double>(now - 20 * 86400), 600);
    EXPECT_NEAR(static_cast<double>(token.identities[0].notAfter),
                static_cast<double>(now - 10 * 86400), 600);
    EXPECT_FALSE(token.identities[0].validAt(now));
}

TEST_F(IdentityRulesTest, SigningNeedsTheKeyAndTheCertificateToAllowIt) {
    CardIdentity keyRefuses = identity("p256", "Key");
    keyRefuses.sign = false;
    CardIdentity certificateRefuses = identity("p256", "Certificate");
    certificateRefuses.certificates[0].keyUsage = "keyAgreement";
    CardIdentity allowed = identity("p256", "Allowed");
    allowed.certificates[0].keyUsage = "critical,nonRepudiation";

    for (const Identity& identity : tokenWith({keyRefuses, certificateRefuses, allowed}).identities)
        EXPECT_EQ(identity.canSign, identity.name == "Allowed") << identity.name;
}

TEST_F(IdentityRulesTest, KeysOfAllUsualSizesCount) {
    const Token token =
        tokenWith({identity("rsa2048", "a"), identity("rsa3072", "b"), identity("rsa4096", "c"),
                   identity("p256", "d"), identity("p384", "e"), identity("p521", "f")});

    EXPECT_THAT(namesOf(token.identities), ElementsAre("a", "b", "c", "d", "e", "f"));
}

TEST_F(IdentityRulesTest, AnRsaKeyThatMayDecryptWrapsBeforeAnEcKey) {
    CardIdentity signsOnly = identity("rsa2048", "Signs");
    signsOnly.decrypt = false;

    const Token token =
        tokenWith({identity("p256", "Derives"), signsOnly, identity("rsa2048", "Decrypts")});

    const auto wraps = std::ranges::find(token.identities, "Decrypts", &Identity::name);
    EXPECT_EQ(token.wrapKeyHash, wraps->publicKeyHash);
}

TEST_F(IdentityRulesTest, AnEcKeyThatMayDeriveWrapsWhereNoRsaKeyMay) {
    CardIdentity signsOnly = identity("rsa2048", "Signs");
    signsOnly.decrypt = false;
    CardIdentity notAgreeing = identity("p256", "Signs too");
    notAgreeing.certificates[0].keyUsage = "digitalSignature";

    const Token token = tokenWith({signsOnly, notAgreeing, identity("p384", "Derives")});

    const auto wraps = std::ranges::find(token.identities, "Derives", &Identity::name);
    EXPECT_EQ(token.wrapKeyHash, wraps->publicKeyHash);
}

TEST_F(IdentityRulesTest, ACardWithoutSuchAKeyHasNoWrapKey) {
    CardIdentity signsOnly = identity("p256", "Signs");
    signsOnly.derive = false;

    EXPECT_FALSE(tokenWith({signsOnly}).wrapKeyHash);
}

struct NameCase {
    const char* why;
    CardCertificate certificate;
    std::string label;
    std::string name;
};

class IdentityNameTest : public IdentityRulesTest {};

TEST_F(IdentityNameTest, IsTheFirstThatTheCertificateHas) {
    const std::string kPrincipal = "otherName:1.3.6.1.4.1.311.20.2.3;UTF8:alice@CORP";
    const std::string kLong(200, 'x');
    const std::vector<NameCase> cases = {
        {"common name",
         {.commonName = "A", .email = "b@x", .alternateName = "email:c@x"},
         "d",
         "A"},
        {"e-mail of the subject", {.email = "b@x", .alternateName = "email:c@x"}, "d", "b@x"},
        {"e-mail", {.alternateName = kPrincipal + ",email:c@x"}, "d", "c@x"},
        {"principal name", {.alternateName = kPrincipal}, "d", "alice@CORP"},
        {"label", {}, "the label", "the label"},
        {"nothing", {}, "", ""},
        {"blanks only", {.commonName = "   "}, "behind blanks", "behind blanks"},
        {"control characters",
         {.commonName = "a\n\x1b[31m\x7f"
                        "b"},
         "",
         "a\ufffd\ufffd[31m\ufffd"
         "b"},
        {"direction", {.commonName = "\u202egpj.exe\u2066"}, "", "\ufffdgpj.exe\ufffd"},
        {"right-to-left text", {.commonName = "שלום"}, "", "שלום"},
        {"200 letters",
         {.commonName = kLong.substr(0, 64), .alternateName = ""},
         "",
         kLong.substr(0, 64)},
    };
    std::vector<Card> all;
    for (const NameCase& each : cases) {
        CardIdentity one = identity("p256", "");
        one.certificates[0] = each.certificate;
        one.label = each.label;
        all.push_back({.label = each.why, .identities = {one}});
    }
    cards.add(all);

    const auto tokens = list();

    for (const NameCase& each : cases) {
        SCOPED_TRACE(each.why);
        const auto token = std::ranges::find(tokens, each.why, &Token::name);
        ASSERT_NE(token, tokens.end());
        ASSERT_THAT(token->identities, SizeIs(1));
        EXPECT_EQ(token->identities[0].name, each.name);
    }
}

TEST_F(IdentityNameTest, OfTwoHundredLettersIsKeptWhole) {
    CardIdentity longLabel = identity("p256", "");
    longLabel.label = std::string(200, 'x');
    CardIdentity tooLong = identity("p256", "");
    tooLong.label = std::string(300, 'y');

    EXPECT_THAT(namesOf(tokenWith({longLabel, tooLong}).identities),
                ElementsAre(std::string(200, 'x'), std::string(256, 'y') + "..."));
}

TEST_F(IdentityNameTest, OfACardIsMadeHarmlessToo) {
    cards.add("bad\n\x1b[0m name", {});

    const auto all = list();

    ASSERT_THAT(all, SizeIs(1));
    EXPECT_EQ(all[0].name, "bad\ufffd\ufffd[0m name");
    EXPECT_THAT(all[0].identities, IsEmpty());
}

}  // namespace
}  // namespace vlm::test
