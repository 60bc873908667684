// Pairing and unpairing by who is not root: what is refused at once, and what an administrator is
// asked. What root does is in hints_service_test.cpp.

#include <gmock/gmock.h>

#include "hints_service_fixture.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Pair;
using testing::StartsWith;
using Outcome = RightVerdict::Outcome;

class PairingChangeTest : public HintsServiceTest {
protected:
    PairingChangeTest() {
        tokens.insert(tokenOf("pkcs11:token=a", "Card A", {identityOf(1, "Alice")}));
        tokens.insert(tokenOf("pkcs11:token=b", "Card B", {identityOf(2, "Alice")}), "123456");
    }

    void proveKey(std::uint8_t key = 1) {
        auto request = loginWithPin(key, "123456");
        request.message.set("str1", std::string(key == 1 ? "pkcs11:token=a" : "pkcs11:token=b"));
        ASSERT_EQ(result(ask(alice(), request)), 0);
    }
    // Everything up to the question to the administrator.
    void beginPairing() {
        proveKey();
        ASSERT_FALSE(ask(alice(), pair("alice", 1)));
        ASSERT_EQ(authority.open(), 1u);
    }
    std::vector<std::pair<std::string, Bytes>> paired() const {
        std::vector<std::pair<std::string, Bytes>> all;
        for (const auto& each : pairings.all()) all.emplace_back(each.account, each.hash);
        return all;
    }
};

TEST_F(PairingChangeTest, PairsTheOwnAccountWhenAnAdministratorAllowsIt) {
    beginPairing();
    EXPECT_TRUE(pairings.all().empty());

    authority.grant();

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_THAT(paired(), ElementsAre(Pair("alice", hashOf(1))));
}

TEST_F(PairingChangeTest, UnpairsTheOwnAccountWhenAnAdministratorAllowsIt) {
    pairings.pair("alice", hashOf(7), kNow);
    ASSERT_FALSE(ask(alice(), unpair("alice", 7)));
    EXPECT_EQ(pairings.all().size(), 1u);

    authority.grant();

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_TRUE(pairings.all().empty());
}

TEST_F(PairingChangeTest, TellsTheAdministratorWhatIsAsked) {
    beginPairing();

    const auto& question = authority.questions.at(0);
    EXPECT_EQ(question.caller.connection, alice().connection);
    EXPECT_EQ(question.sentence,
              "Authentication is required to pair the card \"$(card)\" (key $(key)) with the "
              "account $(account)");
    EXPECT_THAT(question.details, ElementsAre(Pair("account", "alice"), Pair("card", "Card A"),
                                              Pair("key", "0101010101010101...")));
}

TEST_F(PairingChangeTest, LetsNoCardEndItsNameInTheQuestion) {
    tokens.insert(tokenOf("pkcs11:token=c", "C\" (key 0000) with the account bob. \"",
                          {identityOf(7, "Alice")}));
    pairings.pair("alice", hashOf(7), kNow);

    ask(alice(), unpair("alice", 7));

    EXPECT_EQ(authority.questions.at(0).details.at("card"),
              "C' (key 0000) with the account bob. '");
}

TEST_F(PairingChangeTest, TellsTheAdministratorOfAKeyWhoseCardIsNotInserted) {
    pairings.pair("alice", hashOf(7), kNow);
    ask(alice(), unpair("alice", 7));

    const auto& question = authority.questions.at(0);
    EXPECT_EQ(question.sentence,
              "Authentication is required to unpair a card (key $(key)) from the account "
              "$(account)");
    EXPECT_THAT(question.details,
                ElementsAre(Pair("account", "alice"), Pair("key", "0707070707070707...")));
}

TEST_F(PairingChangeTest, AsksNobodyForAnotherAccount) {
    proveKey();
    pairings.pair("bob", hashOf(7), kNow);

    EXPECT_EQ(result(ask(alice(), pair("bob", 1))), status::kNotPermitted);
    EXPECT_EQ(result(ask(alice(), unpair("bob", 7))), status::kNotPermitted);
    EXPECT_EQ(result(ask(alice(), pair("root", 1))), status::kNotPermitted);
    EXPECT_TRUE(authority.questions.empty());
}

TEST_F(PairingChangeTest, AsksNobodyWithoutAProof) {
    EXPECT_EQ(result(ask(alice(), pair("alice", 1))), status::kNotProved);
    EXPECT_TRUE(authority.questions.empty());
}

TEST_F(PairingChangeTest, AsksNobodyAboutAPairingThatIsNotThere) {
    EXPECT_EQ(result(ask(alice(), unpair("alice", 7))), status::kNotPaired);
    EXPECT_TRUE(authority.questions.empty());
}

TEST_F(PairingChangeTest, AsksNobodyWhenThePairingsCannotBeRead) {
    pairings.breakDown("the disk is gone");

    EXPECT_EQ(result(ask(alice(), unpair("alice", 7))), status::kStoreFailed);
    EXPECT_TRUE(authority.questions.empty());
}

struct Unattended {
    SessionState state;
    const char* text;
};
constexpr Unattended kUnattended[] = {
    {SessionState::None, "in no session"},       {SessionState::Away, "from afar"},
    {SessionState::Inactive, "another session"}, {SessionState::Locked, "the screen is locked"},
    {SessionState::Unknown, "logind"},
};

TEST_F(PairingChangeTest, AsksNobodyInASessionWhereNobodyCanBeAsked) {
    proveKey();
    for (const auto& [state, text] : kUnattended) {
        SCOPED_TRACE(text);
        sessions.state = state;

        const auto reply = ask(alice(), pair("alice", 1));

        EXPECT_EQ(result(reply), status::kUnattended);
        EXPECT_THAT(errorText(reply), StartsWith("Pairing alice with 0101"));
        EXPECT_THAT(errorText(reply), HasSubstr(text));
    }
    EXPECT_TRUE(authority.questions.empty());
}

TEST_F(PairingChangeTest, ChangesNothingWhenTheQuestionWasDismissedOrDenied) {
    for (const auto& [outcome, expected] : {std::pair(Outcome::Dismissed, status::kCancelled),
                                            std::pair(Outcome::Denied, status::kNotPermitted),
                                            std::pair(Outcome::NobodyToAsk, status::kRightUnknown),
                                            std::pair(Outcome::Failed, status::kRightUnknown)}) {
        beginPairing();

        authority.refuse(outcome, "it left");

        EXPECT_EQ(result(lastReply()), expected);
        EXPECT_THAT(errorText(lastReply()), StartsWith("Pairing alice with 0101"));
    }
    EXPECT_TRUE(pairings.all().empty());
}

TEST_F(PairingChangeTest, HoldsTheProofWhileThePersonReads) {
    beginPairing();
    now += 300'000;

    authority.grant();

    EXPECT_EQ(result(lastReply()), 0);
}

TEST_F(PairingChangeTest, UsesTheProofForOnePairing) {
    beginPairing();
    authority.grant();

    EXPECT_EQ(result(ask(alice(), pair("alice", 1))), status::kNotProved);
}

TEST_F(PairingChangeTest, GivesTheProofBackWhenNothingBecameOfIt) {
    beginPairing();
    authority.refuse(Outcome::Dismissed);

    ask(alice(), pair("alice", 1));

    EXPECT_EQ(authority.open(), 1u);
}

TEST_F(PairingChangeTest, LetsNoSecondPairingRideOnTheProofThatWaits) {
    beginPairing();

    EXPECT_EQ(result(ask(alice(), pair("alice", 1))), status::kNotProved);
    EXPECT_EQ(authority.open(), 1u);
}

TEST_F(PairingChangeTest, AsksForEachOfTwoChangesAtOnce) {
    beginPairing();
    proveKey(2);
    ASSERT_FALSE(ask(alice(), pair("alice", 2)));
    ASSERT_EQ(authority.open(), 2u);

    authority.grantAndKeep("1");
    EXPECT_THAT(paired(), ElementsAre(Pair("alice", hashOf(1))));
    authority.grantAndKeep("1");

    EXPECT_THAT(paired(), ElementsAre(Pair("alice", hashOf(1))));
    EXPECT_EQ(authority.open(), 0u);
}

TEST_F(PairingChangeTest, ServesOthersWhileAPersonReads) {
    beginPairing();

    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "alice"}}))), 0);
    EXPECT_EQ(authority.open(), 1u);
}

TEST_F(PairingChangeTest, WithdrawsTheQuestionOfACallerWhoLeft) {
    beginPairing();

    callers.leave(alice().connection);

    EXPECT_EQ(authority.withdrawn(), 1);
    EXPECT_FALSE(lastReply());
    EXPECT_TRUE(pairings.all().empty());
}

TEST_F(PairingChangeTest, AsksNothingMoreForACallerWhoLeft) {
    proveKey();
    send(alice(), pair("alice", 1));
    sessions.settle();

    callers.leave(alice().connection);
    settle();

    EXPECT_TRUE(authority.questions.empty());
    EXPECT_FALSE(lastReply());
}

TEST_F(PairingChangeTest, ForgetsTheSessionOfACallerWhoLeft) {
    proveKey();
    send(alice(), pair("alice", 1));

    callers.leave(alice().connection);

    EXPECT_EQ(sessions.open(), 0u);
}

TEST_F(PairingChangeTest, PairsNobodyElseWhenTheNameIsAnothersByThen) {
    beginPairing();
    accounts().add("alice", 1001);

    authority.grant();

    EXPECT_EQ(result(lastReply()), status::kNotPermitted);
    EXPECT_TRUE(pairings.all().empty());
}

TEST_F(PairingChangeTest, SaysSoWhenThePairingIsGoneByThen) {
    pairings.pair("alice", hashOf(7), kNow);
    ask(alice(), unpair("alice", 7));
    ASSERT_TRUE(pairings.unpair("alice", hashOf(7)));

    authority.grant();

    EXPECT_EQ(result(lastReply()), status::kNotPaired);
}

TEST_F(PairingChangeTest, AsksNobodyForRoot) {
    pairings.pair("alice", hashOf(7), kNow);
    sessions.state = SessionState::Locked;

    EXPECT_EQ(result(ask(root(), unpair("alice", 7))), 0);
    EXPECT_TRUE(authority.questions.empty());
}

}  // namespace
}  // namespace vlm::service
