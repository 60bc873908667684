#include <gmock/gmock.h>

#include "hints_service_fixture.h"

namespace vlm::service {
namespace {

using platform::LogLevel;
using platform::PropertyList;
using testing::HasSubstr;
using testing::Not;

TEST_F(HintsServiceTest, RefusesWhatIsNoRequestWithATextAndALogLine) {
    const auto reply = ask(root(), {});

    EXPECT_EQ(result(reply), status::kBadRequest);
    EXPECT_THAT(errorText(reply), HasSubstr("\"op\" is missing"));
    EXPECT_THAT(log().texts(LogLevel::Default),
                testing::Contains(HasSubstr("refused for user 0: The request cannot")));
}

TEST_F(HintsServiceTest, AsksThePermissionBeforeAnything) {
    const auto reply = ask(alice(), pair("bob", 1));

    EXPECT_EQ(result(reply), status::kNotPermitted);
    EXPECT_TRUE(pairings.all().empty());
    EXPECT_EQ(tokens.listings, 0);
}

TEST_F(HintsServiceTest, LogsUnderTheCategoryHints) {
    ask(alice(), pair("alice", 1));

    ASSERT_FALSE(log().lines().empty());
    EXPECT_EQ(log().lines()[0].category, "hints");
    EXPECT_EQ(log().lines()[0].subsystem, "org.vlm.token");
}

TEST_F(HintsServiceTest, ServesNoEndpoints) {
    const auto endpoints = ask(root(), requestOf(7, {{"uid", signedNumber(1000)}}));

    EXPECT_EQ(result(endpoints), status::kNotServed);
    EXPECT_NE(errorText(endpoints), "(no error)");
}

// Listing

TEST_F(HintsServiceTest, TellsTheTokenInfoInTheContextOfAList) {
    tokens.insert(tokenOf("pkcs11:token=a", "Card A", {identityOf(1, "Alice")}));

    const auto reply = list(ask(root(), requestOf(1, {{"uid", signedNumber(-1)}})));

    ASSERT_TRUE(reply.dictionary());
    EXPECT_EQ(reply.dictionary()->size(), 1u);
    const auto* context = reply.dictionary()->find("ctx");
    ASSERT_TRUE(context && context->bytes());
    const auto record = platform::readPropertyList(*context->bytes());
    ASSERT_TRUE(record && record->dictionary());
    EXPECT_EQ(*record->dictionary()->find("unv"), PropertyList(PropertyList::Array{"Alice"}));
}

TEST_F(HintsServiceTest, TellsWhenToLookAgainIfAsked) {
    const auto lookAgain = [&](std::int64_t asked) {
        const auto reply =
            ask(root(), requestOf(1, {{"uid", signedNumber(-1)}, {"num1", signedNumber(asked)}}));
        return reply ? reply->integer("num1") : std::nullopt;
    };
    EXPECT_EQ(lookAgain(1), 0);
    EXPECT_EQ(lookAgain(0), std::nullopt);

    tokens.announceNothing();

    EXPECT_EQ(lookAgain(1), 1);
}

class ListingTest : public HintsServiceTest {
protected:
    ListingTest() {
        tokens.insert(tokenOf("a", "Card A", {identityOf(1, "one"), identityOf(2, "two")}));
        tokens.insert(tokenOf("b", "Card B", {identityOf(3, "three")}));
        pairings.pair("alice", hashOf(1), kNow);
        pairings.pair("bob", hashOf(2), kNow);
    }

    PropertyList record(const Caller& caller, const std::optional<std::string>& token = {}) {
        auto request = requestOf(1, {{"uid", signedNumber(-1)}});
        if (token)
            request.message.set("dat1", *platform::writeBinaryPropertyList(
                                            PropertyList::Dictionary{{"tokid", *token}}));
        const auto reply = list(ask(caller, request));
        const auto* context = reply.dictionary() ? reply.dictionary()->find("ctx") : nullptr;
        return context && context->bytes() ? *platform::readPropertyList(*context->bytes())
                                           : PropertyList("(no record)");
    }
};

TEST_F(ListingTest, TellsRootAllAccounts) {
    EXPECT_EQ(*record(root()).dictionary()->find("hsh"),
              PropertyList(PropertyList::Dictionary{{"alice", hashOf(1)}, {"bob", hashOf(2)}}));
}

TEST_F(ListingTest, TellsOthersTheirOwnAccountOnly) {
    const auto seen = record(alice());

    EXPECT_EQ(*seen.dictionary()->find("hsh"),
              PropertyList(PropertyList::Dictionary{{"alice", hashOf(1)}}));
    EXPECT_THAT(seen.describe(), Not(HasSubstr("bob")));
}

TEST_F(ListingTest, TellsAUserWithoutAnAccountNoAccount) {
    const auto seen = record({4711, 30, ":1.30"});

    EXPECT_EQ(*seen.dictionary()->find("hsh"), PropertyList(PropertyList::Dictionary{}));
    EXPECT_EQ(*seen.dictionary()->find("hsv"),
              PropertyList(PropertyList::Array{"another account", "another account"}));
}

TEST_F(ListingTest, CoversTheTokenOfTheQuery) {
    EXPECT_EQ(*record(root(), "b").dictionary()->find("tnh"),
              PropertyList(PropertyList::Array{hashOf(3)}));
}

TEST_F(ListingTest, SaysSoWhenThePairingsCannotBeRead) {
    pairings.breakDown("the disk is gone");

    const auto reply = ask(root(), requestOf(1, {{"uid", signedNumber(-1)}}));

    EXPECT_EQ(result(reply), status::kStoreFailed);
    EXPECT_EQ(errorText(reply), "the disk is gone");
}

// Pairing

class PairingTest : public HintsServiceTest {
protected:
    PairingTest() { tokens.insert(tokenOf("pkcs11:token=a", "Card A", {identityOf(1, "Alice")})); }

    void proveKey() { ASSERT_EQ(result(ask(root(), loginWithPin(1, "123456"))), 0); }
};

TEST_F(PairingTest, PairsAnAccountWithAKeyThatWasProved) {
    proveKey();

    const auto reply = ask(root(), pair("alice", 1));

    EXPECT_EQ(result(reply), 0);
    EXPECT_FALSE(reply->contains("err"));
    ASSERT_EQ(pairings.all().size(), 1u);
    EXPECT_EQ(pairings.all()[0].account, "alice");
    EXPECT_EQ(pairings.all()[0].hash, hashOf(1));
    EXPECT_EQ(pairings.all()[0].pairedAt, kNow);
    EXPECT_THAT(log().texts(LogLevel::Default),
                testing::Contains(testing::StartsWith("paired alice with 0101")));
}

TEST_F(PairingTest, PairsNoKeyThatNoCardHasSignedWith) {
    const auto reply = ask(root(), pair("alice", 1));

    EXPECT_EQ(result(reply), status::kNotProved);
    EXPECT_THAT(errorText(reply), HasSubstr("Pairing alice with 0101"));
    EXPECT_TRUE(pairings.all().empty());
}

TEST_F(PairingTest, PairsNoOtherKeyThanTheOneThatWasProved) {
    proveKey();

    EXPECT_EQ(result(ask(root(), pair("alice", 2))), status::kNotProved);
}

TEST_F(PairingTest, TakesAProofForOnePairingOnly) {
    proveKey();
    ASSERT_EQ(result(ask(root(), pair("alice", 1))), 0);

    EXPECT_EQ(result(ask(root(), pair("bob", 1))), status::kNotProved);
    EXPECT_EQ(pairings.all().size(), 1u);
}

TEST_F(PairingTest, TakesNoProofOfAnotherUser) {
    ASSERT_EQ(result(ask(alice(), loginWithPin(1, "123456"))), 0);

    EXPECT_EQ(result(ask(root(), pair("alice", 1))), status::kNotProved);
}

TEST_F(PairingTest, TakesNoProofThatIsAMinuteOld) {
    proveKey();
    now += 60'000;

    EXPECT_EQ(result(ask(root(), pair("alice", 1))), status::kNotProved);
}

TEST_F(PairingTest, TakesNoLoginThatFailedForAProof) {
    ASSERT_EQ(result(ask(root(), loginWithPin(1, "wrong"))), status::kPinIncorrect);

    EXPECT_EQ(result(ask(root(), pair("alice", 1))), status::kNotProved);
}

TEST_F(PairingTest, PairsNobodyWithoutAnAccountAndKeepsTheProof) {
    proveKey();

    const auto reply = ask(root(), pair("mallory", 1));

    EXPECT_EQ(result(reply), status::kNoSuchAccount);
    EXPECT_THAT(errorText(reply), HasSubstr("no such account"));
    EXPECT_EQ(result(ask(root(), pair("alice", 1))), 0);
}

TEST_F(PairingTest, KeepsTheProofWhenThePairingCouldNotBeWritten) {
    proveKey();
    pairings.breakDown("the disk is full");
    ASSERT_EQ(result(ask(root(), pair("alice", 1))), status::kStoreFailed);

    EXPECT_EQ(result(ask(root(), pair("alice", 1))), status::kStoreFailed);
}

TEST_F(PairingTest, StoresTheNameAsTheAccountDatabaseSpellsIt) {
    accounts().add("ALICE", 1000);
    accounts().add("alice", 1000);
    proveKey();

    ASSERT_EQ(result(ask(root(), pair("ALICE", 1))), 0);

    EXPECT_EQ(pairings.all()[0].account, "alice");
    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "Alice"}}))), 0);
    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "ALICE"}}))), 1);
    EXPECT_EQ(result(ask(root(), unpair("ALICE", 1))), 0);
}

TEST_F(PairingTest, MakesAPairThatIsThereAlreadyTheLatest) {
    pairings.pair("alice", hashOf(1), 1);
    pairings.pair("alice", hashOf(2), 2);
    proveKey();

    ASSERT_EQ(result(ask(root(), pair("alice", 1))), 0);

    ASSERT_EQ(pairings.all().size(), 2u);
    EXPECT_EQ(pairings.all().back().hash, hashOf(1));
}

// Unpairing

TEST_F(PairingTest, UnpairsWithoutACardAndWithoutAProof) {
    pairings.pair("alice", hashOf(7), kNow);

    const auto reply = ask(root(), unpair("alice", 7));

    EXPECT_EQ(result(reply), 0);
    EXPECT_TRUE(pairings.all().empty());
    EXPECT_THAT(log().texts(LogLevel::Default),
                testing::Contains(testing::StartsWith("unpaired alice from 0707")));
}

TEST_F(PairingTest, UnpairsAnAccountThatIsGone) {
    pairings.pair("former", hashOf(7), kNow);

    EXPECT_EQ(result(ask(root(), unpair("former", 7))), 0);
}

TEST_F(PairingTest, SaysSoWhenTheyAreNotPaired) {
    pairings.pair("bob", hashOf(7), kNow);

    const auto reply = ask(root(), unpair("alice", 7));

    EXPECT_EQ(result(reply), status::kNotPaired);
    EXPECT_THAT(errorText(reply), HasSubstr("not paired"));
    EXPECT_EQ(pairings.all().size(), 1u);
}

TEST_F(PairingTest, SaysSoWhenUnpairingCouldNotBeWritten) {
    pairings.breakDown("the disk is full");

    EXPECT_EQ(result(ask(root(), unpair("alice", 7))), status::kStoreFailed);
}

// Asking about pairings

TEST_F(PairingTest, TellsWhetherAnAccountIsPaired) {
    pairings.pair("alice", hashOf(7), kNow);
    pairings.pair("former", hashOf(8), kNow);

    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "alice"}}))), 1);
    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "bob"}}))), 0);
    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "former"}}))), 1);
    EXPECT_EQ(result(ask(alice(), requestOf(6, {{"str1", "alice"}}))), 1);
    EXPECT_EQ(result(ask(alice(), requestOf(6, {{"str1", "bob"}}))), status::kNotPermitted);
}

TEST_F(PairingTest, SaysSoWhenItCannotTellWhetherAnAccountIsPaired) {
    pairings.breakDown("the disk is gone");

    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "alice"}}))), status::kStoreFailed);
}

TEST_F(PairingTest, ListsTheHashesOfAnAccountTheLatestFirst) {
    for (const std::uint8_t key : {1, 2, 3}) pairings.pair("alice", hashOf(key), kNow);
    pairings.pair("bob", hashOf(4), kNow);

    const auto reply = ask(root(), requestOf(4, {{"num1", signedNumber(0)}, {"str1", "alice"}}));

    EXPECT_EQ(list(reply), PropertyList(PropertyList::Dictionary{
                               {"0", hashOf(3)}, {"1", hashOf(2)}, {"2", hashOf(1)}}));
    EXPECT_EQ(tokens.listings, 0);
}

TEST_F(PairingTest, ListsTheHashesOnInsertedTokensOnlyWhenAskedTo) {
    for (const std::uint8_t key : {1, 2, 3}) pairings.pair("alice", hashOf(key), kNow);

    const auto reply = ask(alice(), requestOf(4, {{"num1", signedNumber(1)}, {"str1", "alice"}}));

    EXPECT_EQ(list(reply), PropertyList(PropertyList::Dictionary{{"0", hashOf(1)}}));
}

TEST_F(PairingTest, ListsNothingForAnAccountWithoutPairings) {
    const auto reply = ask(root(), requestOf(4, {{"num1", signedNumber(0)}, {"str1", "bob"}}));

    EXPECT_EQ(list(reply), PropertyList(PropertyList::Dictionary{}));
}

TEST_F(HintsServiceTest, LetsGoOfAnswersThatComeAfterItIsGone) {
    fakes::FakeTokens cards;
    int replies = 0;
    {
        HintsService shortLived{
            {.login = {cards, prompt, {}, {}},
             .changes = {cards, pairings, proofs, sessions, right, [] { return kNow; }},
             .unlockKeys = {tokens, pairings, pairings, keyrings},
             .sessionLogin = sessionLogin,
             .callers = callers}};
        const auto count = [&](const platform::Message&) { ++replies; };
        shortLived.handle(root(), requestOf(1, {{"uid", signedNumber(-1)}}), count);
        shortLived.handle(root(), login(1), count);
    }

    cards.settle();

    EXPECT_EQ(replies, 0);
}

}  // namespace
}  // namespace vlm::service
