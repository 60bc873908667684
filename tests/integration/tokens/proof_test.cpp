// Proofs by real software cards.

#include <gmock/gmock.h>

#include <fstream>

#include "services/hints/tokens/signature.h"
#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using Outcome = Proof::Outcome;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;
using namespace std::chrono_literals;

class ProofTest : public TokensTest {
protected:
    ProofTest() {
        configureOnly("counting");
        options.environment.push_back("VLM_TEST_LOGIN_COUNT=" + countFile());
    }

    std::string countFile() const { return cards.folder() / "logins"; }

    // Logins and logouts in the order in which the module saw them.
    std::vector<std::string> logins() const {
        std::vector<std::string> lines;
        std::ifstream file(countFile());
        for (std::string line; std::getline(file, line);) lines.push_back(line);
        return lines;
    }

    void expectValid(const Identity& identity, const Proof& proof) {
        EXPECT_EQ(proof.outcome, Outcome::Signed) << proof.reason;
        const platform::Bytes challenge(32, 0x5A);
        EXPECT_TRUE(service::verifySignature(identity.publicKeyInfo, identity.publicKeyHash,
                                             challenge, proof.signature));
        const platform::Bytes another(32, 0x5B);
        EXPECT_FALSE(service::verifySignature(identity.publicKeyInfo, identity.publicKeyHash,
                                              another, proof.signature));
    }
};

TEST_F(ProofTest, IsMadeByKeysOfAllKindsAndSizes) {
    cards.add("card", {identity("rsa2048", "a"), identity("rsa3072", "b"), identity("rsa4096", "c"),
                       identity("p256", "d"), identity("p384", "e"), identity("p521", "f")});
    const Token token = tokenCalled("card");

    ASSERT_THAT(token.identities, SizeIs(6));
    for (const Identity& identity : token.identities) {
        SCOPED_TRACE(identity.name);
        expectValid(identity, prove(token, identity, SoftCards::kPin));
    }
}

TEST_F(ProofTest, LogsInOnceAndOutAgain) {
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");

    prove(token, token.identities[0], SoftCards::kPin);

    EXPECT_THAT(logins(), ElementsAre("login", "logout"));
}

TEST_F(ProofTest, OfAWrongPinIsRefusedAfterOneTry) {
    cards.add("My card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("My card");

    const Proof proof = prove(token, token.identities[0], "654321");

    EXPECT_EQ(proof.outcome, Outcome::PinIncorrect);
    EXPECT_EQ(proof.pinStateAfter, PinState::FewTriesLeft);
    EXPECT_THAT(proof.reason, HasSubstr("\"My card\" refused the PIN; few tries are left"));
    EXPECT_THAT(proof.reason, Not(HasSubstr("654321")));
    EXPECT_THAT(proof.signature, IsEmpty());
    EXPECT_THAT(logins(), ElementsAre("login"));
    EXPECT_EQ(tokenCalled("My card").pinState, PinState::FewTriesLeft);
}

TEST_F(ProofTest, ChecksThePinEachTime) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(prove(token, token.identities[0], SoftCards::kPin).outcome, Outcome::Signed);
    EXPECT_EQ(prove(token, token.identities[0], "654321").outcome, Outcome::PinIncorrect);
    EXPECT_EQ(prove(token, token.identities[0], SoftCards::kPin).outcome, Outcome::Signed);
}

TEST_F(ProofTest, WithoutAPinAsksTheCardForNothing) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(prove(token, token.identities[0], "").outcome, Outcome::CardFailed);

    EXPECT_THAT(logins(), IsEmpty());
}

TEST_F(ProofTest, NeedsTheCardAndTheKeyToBeThere) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");
    Identity unknown = token.identities[0];
    unknown.publicKeyHash = platform::Bytes(32, 1);
    Token pulled = token;
    pulled.identifier = "pkcs11:model=x;manufacturer=y;serial=z;token=t";

    EXPECT_EQ(prove(token, unknown, SoftCards::kPin).outcome, Outcome::NoSuchKey);
    EXPECT_EQ(prove(pulled, token.identities[0], SoftCards::kPin).outcome, Outcome::NoSuchToken);
    EXPECT_THAT(logins(), IsEmpty());
}

TEST_F(ProofTest, OfACardThatWasPulledSinceIsRefused) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");
    cards.remove("card");

    EXPECT_EQ(prove(token, token.identities[0], SoftCards::kPin).outcome, Outcome::NoSuchToken);
}

TEST_F(ProofTest, FindsACardThatWasNotListedBefore) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");
    dropTokens();

    expectValid(token.identities[0], prove(token, token.identities[0], SoftCards::kPin));
}

TEST_F(ProofTest, FindsTheRightOneOfKeysWithOneId) {
    std::vector<CardIdentity> identities;
    for (const char* kind : {"p256", "p256", "p256", "rsa2048", "rsa2048"}) {
        identities.push_back(identity(kind, "Somebody"));
        identities.back().id = "07";
    }
    cards.add("card", identities);
    const Token token = tokenCalled("card");

    ASSERT_THAT(token.identities, SizeIs(5));
    for (const Identity& identity : token.identities)
        expectValid(identity, prove(token, identity, SoftCards::kPin));
}

TEST_F(ProofTest, OfACertificateThatWasOnlyBelievedFailsWithoutItsKey) {
    CardIdentity alone = identity("p256", "Alone");
    alone.privateKey = alone.publicKey = false;
    cards.add("card", {alone});
    const Token token = tokenCalled("card");

    ASSERT_THAT(token.identities, SizeIs(1));
    EXPECT_EQ(prove(token, token.identities[0], SoftCards::kPin).outcome, Outcome::NoSuchKey);
    EXPECT_THAT(logins(), ElementsAre("login", "logout"));
}

TEST_F(ProofTest, LogsInAgainForAKeyThatAsksForIt) {
    CardIdentity careful = identity("rsa2048", "Careful");
    careful.alwaysAuthenticate = true;
    cards.add("card", {careful});
    const Token token = tokenCalled("card");

    expectValid(token.identities[0], prove(token, token.identities[0], SoftCards::kPin));

    EXPECT_THAT(logins(), ElementsAre("login", "login-again", "logout"));
}

TEST_F(ProofTest, IsMadeByACardThatDoesNotHash) {
    options.environment.emplace_back("VLM_TEST_RAW_RSA=1");
    cards.add("card", {identity("rsa2048", "Alice")});
    const Token token = tokenCalled("card");

    expectValid(token.identities[0], prove(token, token.identities[0], SoftCards::kPin));
}

TEST_F(ProofTest, RefusesAKeyThatIsTooSmall) {
    cards.add("card", {identity("rsa1024", "Small")});
    const Token token = tokenCalled("card");

    ASSERT_THAT(token.identities, SizeIs(1));
    EXPECT_EQ(prove(token, token.identities[0], SoftCards::kPin).outcome, Outcome::CardFailed);
}

TEST_F(ProofTest, OutOfBoundsIsRefusedAndHarmsNothing) {
    cards.add("card", {identity("p256", "Alice")});
    const Token token = tokenCalled("card");

    EXPECT_EQ(prove(token, token.identities[0], std::string(257, '1')).outcome,
              Outcome::CardFailed);
    EXPECT_THAT(warnings(), IsEmpty());

    expectValid(token.identities[0], prove(token, token.identities[0], SoftCards::kPin));
}

class PinPadTest : public TokensTest {
protected:
    PinPadTest() {
        configureOnly("pin_pad");
        options.environment.push_back("VLM_TEST_PIN_PAD=" + padFile());
        cards.add("card", {identity("p256", "Alice")});
    }
    std::string padFile() const { return cards.folder() / "pad"; }
    void type(const std::string& text) { std::ofstream(padFile()) << text; }
};

TEST_F(PinPadTest, TheReaderAsksForThePin) {
    type(SoftCards::kPin);
    const Token token = tokenCalled("card");

    EXPECT_TRUE(token.hasPinPad);
    EXPECT_EQ(prove(token, token.identities[0], "").outcome, Outcome::Signed);
}

TEST_F(PinPadTest, ThePersonMayPressCancelOrMistype) {
    const Token token = tokenCalled("card");

    type("cancel");
    EXPECT_EQ(prove(token, token.identities[0], "").outcome, Outcome::Cancelled);
    type("654321");
    EXPECT_EQ(prove(token, token.identities[0], "").outcome, Outcome::PinIncorrect);
}

TEST_F(PinPadTest, AListingDoesNotWaitForThePersonLongerThanItsOwnLimit) {
    const auto before = list();
    ASSERT_THAT(before, SizeIs(1));
    dropTokens();
    options.limits.list = 2s;
    ASSERT_EQ(list(), before);
    service::ProofRequest request;
    request.tokenIdentifier = before[0].identifier;
    request.publicKeyHash = before[0].identities[0].publicKeyHash;
    bool proved = false;
    tokens().prove(std::move(request), [&proved](Proof) { proved = true; });

    EXPECT_EQ(list(), before);
    EXPECT_FALSE(proved);
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(PinPadTest, SomebodyWhoWentAwayCostsTheProofOnly) {
    const Token token = tokenCalled("card");
    dropTokens();
    options.limits.prove = 300ms;

    const Proof proof = prove(token, token.identities[0], "");

    EXPECT_EQ(proof.outcome, Outcome::CardFailed);
    EXPECT_THAT(proof.reason, HasSubstr("did not answer in time"));
    EXPECT_THAT(warnings(), SizeIs(1));
    EXPECT_EQ(tokenCalled("card").identifier, token.identifier);
}

}  // namespace
}  // namespace vlm::test
