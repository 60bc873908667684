// What real software cards open in the login that they sign in: unlock keys that were wrapped here.

#include <gmock/gmock.h>

#include <algorithm>
#include <chrono>
#include <fstream>
#include <ostream>

#include "services/keychain/unlock_key_wrapping.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using Outcome = Proof::Outcome;
using service::OpenRequest;
using service::WrapScheme;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

const std::string kPassword = "correct horse";

class OpeningTest : public TokensTest {
protected:
    // Wraps with the public half of the token's wrap key, as the token says that it can open.
    void wrapFor(const Token& token) { wrapFor(token, token.wrapScheme); }
    void wrapFor(const Token& token, WrapScheme scheme) {
        ASSERT_TRUE(token.wrapKeyHash);
        const auto identity =
            std::ranges::find(token.identities, *token.wrapKeyHash, &Identity::publicKeyHash);
        ASSERT_NE(identity, token.identities.end());
        purpose = {"alice", token.identities[0].publicKeyHash, *token.wrapKeyHash};
        const auto made = service::wrapUnlockKey(service::Secret(kPassword), purpose,
                                                 identity->publicKeyInfo, scheme);
        ASSERT_TRUE(made);
        wrapped = *made;
    }

    Proof proveAndOpen(const Token& token, const std::string& pin = SoftCards::kPin) {
        return proveAndOpen(token, service::cardTask(wrapped, purpose.wrapKeyHash), pin);
    }
    Proof proveAndOpen(const Token& token, std::optional<OpenRequest> open,
                       const std::string& pin = SoftCards::kPin) {
        service::ProofRequest request;
        request.tokenIdentifier = token.identifier;
        request.publicKeyHash = token.identities[0].publicKeyHash;
        request.challenge = platform::Bytes(32, 0x5A);
        request.pin = service::Secret(pin);
        request.open = std::move(open);
        return proveWith(std::move(request));
    }

    std::optional<std::string> passwordIn(const Proof& proof) const {
        if (!proof.opened) return {};
        const auto unlockKey = service::unwrapUnlockKey(wrapped, *proof.opened, purpose);
        if (!unlockKey) return {};
        return std::string(unlockKey->text());
    }

    void expectOpened(const Proof& proof) const {
        EXPECT_EQ(proof.outcome, Outcome::Signed) << proof.reason;
        EXPECT_EQ(passwordIn(proof), kPassword) << proof.whyNotOpened;
        EXPECT_THAT(proof.whyNotOpened, IsEmpty());
    }

    // The signature is good all the same.
    static void expectUnopened(const Proof& proof, const std::string& why) {
        EXPECT_EQ(proof.outcome, Outcome::Signed) << proof.reason;
        EXPECT_THAT(proof.signature, testing::Not(IsEmpty()));
        EXPECT_FALSE(proof.opened);
        EXPECT_THAT(proof.whyNotOpened, HasSubstr(why));
    }

    service::UnlockKeyPurpose purpose;
    platform::Bytes wrapped;
};

TEST_F(OpeningTest, IsDoneByKeysOfAllKindsAndSizes) {
    const std::vector<std::pair<std::string, WrapScheme>> kinds = {
        {"rsa2048", WrapScheme::RsaOaepSha256},
        {"rsa3072", WrapScheme::RsaOaepSha256},
        {"rsa4096", WrapScheme::RsaOaepSha256},
        {"p256", WrapScheme::Ecdh},
        {"p384", WrapScheme::Ecdh},
        {"p521", WrapScheme::Ecdh}};
    for (const auto& [kind, scheme] : kinds) cards.add(kind, {identity(kind, kind)});
    for (const auto& [kind, scheme] : kinds) {
        SCOPED_TRACE(kind);
        const Token token = tokenCalled(kind);
        EXPECT_EQ(token.wrapScheme, scheme);
        wrapFor(token);
        expectOpened(proveAndOpen(token));
    }
}

TEST_F(OpeningTest, IsDoneWithTheOldPaddingWhereThatIsAsked) {
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token, WrapScheme::RsaPkcs1);

    expectOpened(proveAndOpen(token));
}

TEST_F(OpeningTest, IsDoneByTheRsaKeyOfACardThatHasBoth) {
    CardIdentity signs = identity("p384", "Signs");
    cards.add("card", {identity("p256", "EC"), signs, identity("rsa2048", "RSA")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(token.wrapScheme, WrapScheme::RsaOaepSha256);
    wrapFor(token);
    for (int i = 0; i < 2; ++i) expectOpened(proveAndOpen(token));
}

TEST_F(OpeningTest, IsNotDoneWhereNothingIsAsked) {
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");

    const Proof proof = proveAndOpen(token, std::nullopt);

    EXPECT_EQ(proof.outcome, Outcome::Signed);
    EXPECT_FALSE(proof.opened);
    EXPECT_THAT(proof.whyNotOpened, IsEmpty());
}

TEST_F(OpeningTest, IsNotDoneForAWrongPin) {
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token);

    const Proof proof = proveAndOpen(token, "654321");

    EXPECT_EQ(proof.outcome, Outcome::PinIncorrect);
    EXPECT_FALSE(proof.opened);
}

TEST_F(OpeningTest, IsNoneForAKeyThatMayOnlySign) {
    CardIdentity signs = identity("rsa2048", "Signs");
    signs.decrypt = false;
    cards.add("signer", {signs});
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token signer = tokenCalled("signer");
    EXPECT_FALSE(signer.wrapKeyHash);

    expectUnopened(
        proveAndOpen(signer, OpenRequest{signer.identities[0].publicKeyHash,
                                         WrapScheme::RsaOaepSha256, platform::Bytes(256, 1)}),
        "the card \"signer\" opened nothing: ");
}

TEST_F(OpeningTest, IsNoneOfWhatIsNotForTheCard) {
    cards.add("mine", {identity("rsa2048", "Alice")});
    cards.add("other", {identity("rsa2048", "Alice")});
    cards.add("curve", {identity("p256", "Alice")});
    const Token mine = tokenCalled("mine");
    const Token curve = tokenCalled("curve");
    wrapFor(tokenCalled("other"));
    const auto task = *service::cardTask(wrapped, purpose.wrapKeyHash);
    OpenRequest forMine = task;
    forMine.wrapKeyHash = mine.identities[0].publicKeyHash;
    OpenRequest forCurve = task;
    forCurve.wrapKeyHash = curve.identities[0].publicKeyHash;

    expectUnopened(proveAndOpen(mine, task), "it has no such identity");
    expectUnopened(proveAndOpen(mine, forMine), "the card \"mine\" opened nothing: ");
    expectUnopened(proveAndOpen(curve, forCurve), "the key is of another kind");
}

TEST_F(OpeningTest, IsNotEvenTriedOfWhatNoKeyMade) {
    cards.add("card", {identity("rsa2048", "RSA")});
    cards.add("curve", {identity("p256", "EC")});
    const Token token = tokenCalled("card");
    const Token curve = tokenCalled("curve");
    const auto rsa = [&token](std::size_t size) {
        return OpenRequest{*token.wrapKeyHash, WrapScheme::RsaOaepSha256, platform::Bytes(size, 1)};
    };
    const auto ec = [&curve](platform::Bytes point) {
        return OpenRequest{*curve.wrapKeyHash, WrapScheme::Ecdh, std::move(point)};
    };
    platform::Bytes offTheCurve(65, 1);
    offTheCurve.front() = 4;

    for (const std::size_t size : {0, 255, 257, 8192})
        expectUnopened(proveAndOpen(token, rsa(size)), "not of the key's size");
    for (const auto& point : {offTheCurve, platform::Bytes{}, platform::Bytes{0},
                              platform::Bytes(33, 2), platform::Bytes(97, 4)})
        expectUnopened(proveAndOpen(curve, ec(point)), "no point of the key's curve");
    EXPECT_THAT(warnings(), IsEmpty());
}

// With a module that has one trait, or fault.
class OpeningModuleTest : public OpeningTest {
protected:
    OpeningModuleTest() {
        options.environment.push_back("VLM_TEST_LOGIN_COUNT=" + countFile());
        configureOnly("counting");
    }
    void beA(const std::string& trait) {
        options.environment.push_back("VLM_TEST_OPENING=" + trait);
        cards.configureModule("counting", "module:\n");
        configureModule("opening");
    }
    std::string countFile() const { return cards.folder() / "logins"; }
    std::vector<std::string> logins() const {
        std::vector<std::string> lines;
        std::ifstream file(countFile());
        for (std::string line; std::getline(file, line);) lines.push_back(line);
        return lines;
    }
};

TEST_F(OpeningModuleTest, TakesOneLoginForBoth) {
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectOpened(proveAndOpen(token));

    EXPECT_THAT(logins(), ElementsAre("login", "logout"));
}

TEST_F(OpeningModuleTest, LogsInAgainOnceForAKeyThatAsksForIt) {
    CardIdentity careful = identity("rsa2048", "Careful");
    careful.alwaysAuthenticate = true;
    cards.add("card", {careful});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectOpened(proveAndOpen(token));

    EXPECT_THAT(logins(), ElementsAre("login", "login-again", "login-again", "logout"));
}

TEST_F(OpeningModuleTest, DerivesWithAKeyThatAsksForThePinEachTime) {
    CardIdentity careful = identity("p256", "Careful");
    careful.alwaysAuthenticate = true;
    cards.add("card", {careful});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectOpened(proveAndOpen(token));
}

TEST_F(OpeningModuleTest, WithTheOldPaddingOnlyUsesThat) {
    beA("pkcs1-only");
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(token.wrapScheme, WrapScheme::RsaPkcs1);
    wrapFor(token);
    expectOpened(proveAndOpen(token));
    wrapFor(token, WrapScheme::RsaOaepSha256);
    expectUnopened(proveAndOpen(token), "opened nothing: ");
}

TEST_F(OpeningModuleTest, WithOaepOfItsOwnUsesThat) {
    beA("oaep-only");
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(token.wrapScheme, WrapScheme::RsaOaepSha256);
    wrapFor(token);
    expectOpened(proveAndOpen(token));
}

TEST_F(OpeningModuleTest, ThatLeavesAZeroInFrontOutIsUnderstood) {
    beA("short");
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectOpened(proveAndOpen(token));
}

TEST_F(OpeningModuleTest, WithoutAnyOfItHasNoWrapKey) {
    beA("nothing");
    cards.add("card", {identity("rsa2048", "RSA"), identity("p256", "EC")});

    EXPECT_FALSE(tokenCalled("card").wrapKeyHash);
}

// Whatever a module does in the opening, the proof that was made before stays.
struct Fault {
    const char* trait;
    const char* why;
};
void PrintTo(const Fault& fault, std::ostream* stream) { *stream << fault.trait; }

class OpeningFaultTest : public OpeningModuleTest, public testing::WithParamInterface<Fault> {};

TEST_P(OpeningFaultTest, OfRsaKeepsTheSignature) {
    beA(GetParam().trait);
    options.limits.prove = std::chrono::seconds(3);
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectUnopened(proveAndOpen(token), GetParam().why);
    EXPECT_EQ(tokenCalled("card").identifier, token.identifier);
}

TEST_P(OpeningFaultTest, OfEcdhKeepsTheSignature) {
    beA(GetParam().trait);
    options.limits.prove = std::chrono::seconds(3);
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");
    wrapFor(token);

    expectUnopened(proveAndOpen(token), GetParam().why);
}

INSTANTIATE_TEST_SUITE_P(All, OpeningFaultTest,
                         testing::Values(Fault{"refuses", "opened nothing: "},
                                         Fault{"long", "opened nothing: "},
                                         Fault{"crashes", "crashed or ended"},
                                         Fault{"hangs", "did not answer in time"}));

TEST_F(OpeningModuleTest, ThatOpensSomethingElseOpensNoUnlockKey) {
    beA("lies");
    cards.add("rsa", {identity("rsa2048", "RSA")});
    cards.add("ec", {identity("p256", "EC")});

    for (const char* name : {"rsa", "ec"}) {
        const Token token = tokenCalled(name);
        wrapFor(token);
        const Proof proof = proveAndOpen(token);
        EXPECT_EQ(proof.outcome, Outcome::Signed);
        EXPECT_EQ(passwordIn(proof), std::nullopt) << name;
    }
}

}  // namespace
}  // namespace vlm::test
