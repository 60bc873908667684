#include "services/hints/login.h"

#include <gmock/gmock.h>

#include "hints_service_fixture.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class LoginTest : public HintsServiceTest {
protected:
    void insertCard() {
        tokens.insert(tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")}));
    }
    void insertCard(void (*change)(Token&)) {
        auto card = tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")});
        change(card);
        tokens.insert(card);
    }
};

TEST_F(LoginTest, SucceedsWithThePinOfTheRequestAndAsksNobody) {
    insertCard();

    const auto reply = ask(alice(), loginWithPin(1, "123456"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_FALSE(reply->contains("err"));
    EXPECT_THAT(tokens.pinsTried, ElementsAre("123456"));
    EXPECT_THAT(prompt.questions, IsEmpty());
}

TEST_F(LoginTest, AsksForThePinAndNamesCardAndIdentity) {
    insertCard();

    EXPECT_EQ(ask(alice(), login(1)), std::nullopt);
    ASSERT_EQ(prompt.open(), 1u);
    EXPECT_EQ(prompt.questions[0].card, "PIV Card");
    EXPECT_EQ(prompt.questions[0].identity, "Alice");
    EXPECT_EQ(prompt.questions[0].state, PinState::Ready);
    EXPECT_EQ(prompt.questions[0].account, "alice");
    EXPECT_EQ(prompt.questions[0].caller.user, 1000u);

    prompt.enter("123456");
    EXPECT_EQ(prompt.held(), 0) << "the prompt is gone while the card works";
    tokens.settle();

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_THAT(tokens.pinsTried, ElementsAre("123456"));
}

TEST_F(LoginTest, LetsTheReaderAskWhenItHasAPad) {
    insertCard([](Token& card) { card.hasPinPad = true; });

    EXPECT_EQ(result(ask(alice(), login(1))), 0);

    EXPECT_THAT(prompt.questions, IsEmpty());
    EXPECT_THAT(tokens.pinsTried, ElementsAre(""));
}

TEST_F(LoginTest, NeedsNoPinForACardWithoutALogin) {
    insertCard([](Token& card) {
        card.needsLogin = false;
        card.pinState = PinState::Locked;
    });

    EXPECT_EQ(result(ask(alice(), login(1))), 0);
    EXPECT_THAT(prompt.questions, IsEmpty());
}

TEST_F(LoginTest, ChallengesWithFreshBytesEachTime) {
    insertCard();

    ask(alice(), loginWithPin(1, "123456"));
    ask(alice(), loginWithPin(1, "123456"));

    ASSERT_EQ(tokens.challenges.size(), 2u);
    EXPECT_EQ(tokens.challenges[0].size(), 32u);
    EXPECT_NE(tokens.challenges[0], tokens.challenges[1]);
}

TEST_F(LoginTest, BelievesNoSignatureByAnotherKey) {
    insertCard();
    tokens.signWithAnotherKey();

    const auto reply = ask(root(), loginWithPin(1, "123456"));

    EXPECT_EQ(result(reply), status::kNotProved);
    EXPECT_EQ(result(ask(root(), pair("alice", 1))), status::kNotProved);
}

TEST_F(LoginTest, RefusesACardThatIsNotInserted) {
    const auto reply = ask(alice(), login(1));

    EXPECT_EQ(result(reply), status::kNoSuchToken);
    EXPECT_THAT(errorText(reply), HasSubstr("pkcs11:token=a"));
    EXPECT_THAT(errorText(reply), HasSubstr("not inserted"));
}

TEST_F(LoginTest, RefusesAKeyThatIsOnAnotherCard) {
    insertCard();
    tokens.insert(tokenOf("pkcs11:token=b", "Other", {identityOf(2, "Bob")}));

    EXPECT_EQ(result(ask(alice(), login(2))), status::kNoSuchKey);
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(LoginTest, RefusesAKeyThatIsNotForSigningWithoutAskingForThePin) {
    insertCard([](Token& card) { card.identities[0].canSign = false; });

    const auto reply = ask(alice(), login(1));

    EXPECT_EQ(result(reply), status::kNoSuchKey);
    EXPECT_THAT(errorText(reply), HasSubstr("not for signing"));
    EXPECT_THAT(prompt.questions, IsEmpty());
}

TEST_F(LoginTest, AsksNobodyForALockedPin) {
    insertCard([](Token& card) { card.pinState = PinState::Locked; });

    const auto reply = ask(alice(), login(1));

    EXPECT_EQ(result(reply), status::kPinLocked);
    EXPECT_THAT(errorText(reply), HasSubstr("PUK"));
    EXPECT_THAT(prompt.questions, IsEmpty());
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(LoginTest, PassesOnThatTheNextTryIsTheLast) {
    insertCard([](Token& card) { card.pinState = PinState::LastTry; });

    ask(alice(), login(1));

    ASSERT_EQ(prompt.questions.size(), 1u);
    EXPECT_EQ(prompt.questions[0].state, PinState::LastTry);
}

TEST_F(LoginTest, TriesAWrongPinOnceAndTellsHowManyTriesAreLeft) {
    insertCard();

    const char* const left[] = {"a few tries are left", "one try is left", "no try is left"};
    for (std::size_t tried = 0; tried < 3; ++tried) {
        const auto reply = ask(alice(), loginWithPin(1, "000000"));

        EXPECT_EQ(result(reply), status::kPinIncorrect);
        EXPECT_THAT(errorText(reply), HasSubstr(left[tried]));
        EXPECT_THAT(errorText(reply), HasSubstr("\"Alice\" of the card \"PIV Card\""));
        EXPECT_EQ(tokens.pinsTried.size(), tried + 1);
    }
    EXPECT_EQ(result(ask(alice(), loginWithPin(1, "123456"))), status::kPinLocked);
    EXPECT_EQ(tokens.pinsTried.size(), 3u);
}

struct Failure {
    const char* why;
    Proof::Outcome outcome;
    platform::Status status;
};

TEST_F(LoginTest, TellsEachFailureOfACardApart) {
    const Failure failures[] = {
        {"the card was pulled out", Proof::Outcome::NoSuchToken, status::kNoSuchToken},
        {"its private key is missing", Proof::Outcome::NoSuchKey, status::kNoSuchKey},
        {"its PIN is wrong", Proof::Outcome::PinIncorrect, status::kPinIncorrect},
        {"its PIN is locked", Proof::Outcome::PinLocked, status::kPinLocked},
        {"cancelled on the reader's pad", Proof::Outcome::Cancelled, status::kCancelled},
        {"its module failed", Proof::Outcome::CardFailed, status::kCardFailed},
    };
    insertCard();
    for (const auto& [why, outcome, expected] : failures) {
        SCOPED_TRACE(why);
        tokens.failProofs(outcome, "reader \x1b trouble");

        const auto reply = ask(alice(), loginWithPin(1, "123456"));

        EXPECT_EQ(result(reply), expected);
        EXPECT_THAT(errorText(reply), testing::Not(HasSubstr("\x1b")));
    }
    EXPECT_THAT(errorText(lastReply()), HasSubstr("reader \uFFFD trouble"));
}

TEST_F(LoginTest, TellsWhyNoPinWasEntered) {
    insertCard();

    ask(alice(), login(1));
    prompt.cancel();
    EXPECT_EQ(result(lastReply()), status::kCancelled);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("cancelled"));

    ask(alice(), login(1));
    prompt.stayAway();
    EXPECT_EQ(result(lastReply()), status::kCancelled);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("in time"));

    ask(alice(), login(1));
    prompt.beUnreachable("there is no terminal");
    EXPECT_EQ(result(lastReply()), status::kNoPin);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("because there is no terminal."));

    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(LoginTest, WithdrawsThePromptWhenItsCallerLeaves) {
    insertCard();
    ask(alice(), login(1));
    ASSERT_EQ(prompt.open(), 1u);

    callers.leave(alice().connection);

    EXPECT_EQ(prompt.open(), 0u);
    EXPECT_EQ(callers.watching(), 0u);
    EXPECT_EQ(lastReply(), std::nullopt);
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(LoginTest, KeepsThePromptsOfOtherCallersWhenOneLeaves) {
    insertCard();
    ask(alice(), login(1));
    ask(root(), login(1));
    ASSERT_EQ(prompt.open(), 2u);

    callers.leave(alice().connection);
    prompt.enter("123456");
    tokens.settle();

    EXPECT_EQ(result(lastReply()), 0);
}

TEST_F(LoginTest, HasNoEffectWhenTheCardAnswersAfterTheCallerLeft) {
    insertCard();
    send(root(), loginWithPin(1, "123456"));
    callers.leave(root().connection);

    tokens.settle();

    EXPECT_EQ(lastReply(), std::nullopt);
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(LoginTest, RemembersNoProofForACallerWhoLeftBeforeTheSignatureCame) {
    insertCard();
    ask(root(), login(1));
    prompt.enter("123456");
    callers.leave(root().connection);
    tokens.settle();

    const Caller again{0, 11, ":1.11"};
    EXPECT_EQ(result(ask(again, pair("alice", 1))), status::kNotProved);
}

TEST_F(LoginTest, BeginsNothingForACallerWhoHasLeftAlready) {
    insertCard();
    callers.leave(alice().connection);

    EXPECT_EQ(ask(alice(), login(1)), std::nullopt);
    EXPECT_EQ(tokens.listings, 0);
}

TEST_F(LoginTest, AnswersShortRequestsWhileAPersonIsAsked) {
    insertCard();
    ask(alice(), login(1));

    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "alice"}}))), 0);
    EXPECT_EQ(prompt.open(), 1u);
}

TEST_F(LoginTest, NeverLogsAPin) {
    insertCard();

    ask(alice(), loginWithPin(1, "98765432"));
    ask(alice(), login(1));
    prompt.enter("98765432");
    tokens.settle();

    ASSERT_FALSE(log().lines().empty());
    for (const auto& line : log().lines())
        EXPECT_THAT(line.text, testing::Not(HasSubstr("98765432")));
    EXPECT_THAT(errorText(lastReply()), testing::Not(HasSubstr("98765432")));
}

TEST_F(LoginTest, GivesTheCardNoPinWhenThereIsNothingToChallengeItWith) {
    fakes::FakeTokens cards;
    cards.insert(tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")}));
    HintsService poor{{.login = {cards, prompt, {}, [](std::size_t) { return std::nullopt; }},
                       .changes = {tokens, pairings, proofs, sessions, right, [] { return kNow; }},
                       .unlockKeys = {tokens, pairings, pairings, keyrings},
                       .sessionLogin = sessionLogin,
                       .callers = callers}};
    platform::Message reply;

    poor.handle(root(), loginWithPin(1, "123456"),
                [&](platform::Message answer) { reply = std::move(answer); });
    cards.settle();

    EXPECT_EQ(reply.integer("res"), status::kCardFailed);
    EXPECT_THAT(cards.pinsTried, IsEmpty());
}

}  // namespace
}  // namespace vlm::service
