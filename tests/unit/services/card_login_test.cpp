#include "services/hints/card_login.h"

#include <gmock/gmock.h>

#include "hints_service_fixture.h"
#include "keychain/card_key.h"
#include "services/hints/secret_pipe.h"
#include "services/keychain/unlock_key_wrapping.h"
#include "settings/known_settings.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class CardLoginTest : public HintsServiceTest {
protected:
    CardLoginTest() {
        tokens.insert(tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")}));
        pairings.pair("alice", hashOf(1), kNow);
    }

    // What the card's wrap key can open from now on.
    void storeUnlockKey(const std::string& password, const std::string& account = "alice") {
        const auto wrapped = wrapUnlockKey(Secret(password), {account, hashOf(1), wrapKey.hash()},
                                           wrapKey.publicInfo(), WrapScheme::RsaOaepSha256);
        ASSERT_TRUE(wrapped);
        ASSERT_EQ(pairings.storeUnlockKey(
                      {"alice", hashOf(1), wrapKey.hash(), wrapKey.publicInfo(), *wrapped}),
                  std::nullopt);
        tokens.open = [this](const OpenRequest& request) { return wrapKey.open(request); };
    }
    void requireCards() {
        preferences().put("enforceSmartCard", std::string(kSmartcardDomain),
                          platform::PreferencesUser::Any, 1);
    }

    static IncomingRequest logIn(const std::string& account, const std::string& pin,
                                 std::uint8_t key = 1) {
        auto request = requestOf(
            12, {{"str1", account}, {"str2", text("pkcs11:token=a")}, {"dat1", hashOf(key)}});
        if (!pin.empty()) request.message.set("dat2", *pipeHolding(Secret(pin)));
        return request;
    }
    static std::string unlockKeyIn(const std::optional<platform::Message>& reply) {
        const auto pipe = reply ? reply->endpoint("dat1") : std::nullopt;
        const auto secret = pipe ? secretIn(*pipe) : std::nullopt;
        return secret ? std::string(secret->text()) : "(none)";
    }
    static std::string whyNone(const std::optional<platform::Message>& reply) {
        const auto* why = reply ? reply->text("str1") : nullptr;
        return why ? *why : "(it does not say)";
    }

    // One for all tests, as it takes a while to make.
    static const CardKey& theWrapKey() {
        static const CardKey key("RSA-2048");
        return key;
    }
    const CardKey& wrapKey = theWrapKey();
};

TEST_F(CardLoginTest, LogsInWithThePinAndGivesTheUnlockKey) {
    storeUnlockKey("pw-alice");

    const auto reply = ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(unlockKeyIn(reply), "pw-alice");
    EXPECT_FALSE(reply->contains("str1"));
    EXPECT_THAT(tokens.pinsTried, ElementsAre("123456"));
    EXPECT_THAT(prompt.questions, IsEmpty());
}

TEST_F(CardLoginTest, LogsInAUserOfThisMachine) {
    storeUnlockKey("pw-alice");
    sessions.state = SessionState::Locked;

    EXPECT_EQ(unlockKeyIn(ask(alice(), logIn("alice", "123456"))), "pw-alice");
    EXPECT_EQ(result(ask(alice(), logIn("bob", "123456"))), status::kNotPermitted);
    sessions.state = SessionState::Away;
    EXPECT_EQ(result(ask(alice(), logIn("alice", "123456"))), status::kUnattended);
    EXPECT_EQ(tokens.pinsTried.size(), 1u);
}

TEST_F(CardLoginTest, IsGoodWithoutAnUnlockKeyAndSaysSo) {
    const auto reply = ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(unlockKeyIn(reply), "(none)");
    EXPECT_THAT(whyNone(reply), HasSubstr("no key of the login keyring is stored"));
}

TEST_F(CardLoginTest, IsGoodWithAnUnlockKeyThatTheCardDoesNotOpen) {
    storeUnlockKey("pw-alice");
    tokens.open = nullptr;

    const auto reply = ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(unlockKeyIn(reply), "(none)");
    EXPECT_THAT(whyNone(reply), HasSubstr("cannot be opened"));
    EXPECT_TRUE(std::ranges::any_of(log().lines(), [](const auto& line) {
        return line.text.find("(-2024): the wrap key is gone") != std::string::npos;
    }));
}

TEST_F(CardLoginTest, GivesNoUnlockKeyThatWasWrappedForAnother) {
    storeUnlockKey("pw-bob", "bob");

    const auto reply = ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(unlockKeyIn(reply), "(none)");
    EXPECT_THAT(whyNone(reply), HasSubstr("cannot be opened"));
}

TEST_F(CardLoginTest, GivesNoUnlockKeyForAWrongPinOrSignature) {
    storeUnlockKey("pw-alice");

    auto reply = ask(root(), logIn("alice", "000000"));
    EXPECT_EQ(result(reply), status::kPinIncorrect);
    EXPECT_FALSE(reply->contains("dat1"));
    EXPECT_EQ(tokens.pinsTried.size(), 1u) << "a PIN is tried once";

    tokens.signWithAnotherKey();
    reply = ask(root(), logIn("alice", "123456"));
    EXPECT_EQ(result(reply), status::kNotProved);
    EXPECT_FALSE(reply->contains("dat1"));
}

TEST_F(CardLoginTest, JudgesTheCardAnewWhateverTheCallerSays) {
    accounts().add("ghost", 1005);
    pairings.pair("bob", hashOf(2), kNow);

    EXPECT_EQ(result(ask(root(), logIn("bob", "123456"))), status::kNoLoginCard);
    EXPECT_EQ(result(ask(root(), logIn("ghost", "123456"))), status::kNoLoginCard);
    EXPECT_EQ(result(ask(root(), logIn("nobody-here", "123456"))), status::kNoLoginCard);
    EXPECT_EQ(result(ask(root(), logIn("bob", "123456", 2))), status::kNoLoginCard);
    requireCards();
    EXPECT_EQ(result(ask(root(), logIn("bob", "123456"))), status::kCardRequired);
    tokens.pull("pkcs11:token=a");
    EXPECT_EQ(result(ask(root(), logIn("alice", "123456"))), status::kNoSuchToken);

    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(CardLoginTest, LetsTheReaderAskWhenItHasAPad) {
    tokens.pull("pkcs11:token=a");
    auto card = tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")});
    card.hasPinPad = true;
    tokens.insert(card);

    EXPECT_EQ(result(ask(root(), logIn("alice", ""))), 0);
    EXPECT_THAT(tokens.pinsTried, ElementsAre(""));
}

TEST_F(CardLoginTest, AsksNobodyForAPinThatTheCallerHasNot) {
    const auto reply = ask(root(), logIn("alice", ""));

    EXPECT_EQ(result(reply), status::kNoPin);
    EXPECT_THAT(prompt.questions, IsEmpty());
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(CardLoginTest, RefusesWhoWasUnpairedWhileTheCardWorked) {
    storeUnlockKey("pw-alice");
    send(root(), logIn("alice", "123456"));
    tokens.answerOne();
    ASSERT_EQ(tokens.pinsTried.size(), 1u);
    pairings.unpair("alice", hashOf(1));

    settle();

    EXPECT_EQ(result(lastReply()), status::kNoLoginCard);
    EXPECT_FALSE(lastReply()->contains("dat1"));
}

TEST_F(CardLoginTest, AsksForTheInsertedCardsOnce) {
    const int before = tokens.listings;

    ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(tokens.listings, before + 1);
}

TEST_F(CardLoginTest, IsNoProofForAPairing) {
    ask(root(), logIn("alice", "123456"));

    EXPECT_EQ(result(ask(root(), pair("bob", 1))), status::kNotProved);
}

TEST_F(CardLoginTest, TriesNoPinForACallerWhoHasLeft) {
    send(root(), logIn("alice", "123456"));
    callers.leave(root().connection);
    settle();

    EXPECT_EQ(lastReply(), std::nullopt);
    EXPECT_THAT(tokens.pinsTried, IsEmpty());
}

TEST_F(CardLoginTest, LogsWhoLoggedInButNoSecret) {
    storeUnlockKey("pw-alice-98765");

    ask(root(), logIn("alice", "123456"));

    bool isTold = false;
    for (const auto& line : log().lines()) {
        isTold = isTold || line.text == "alice logs in with the card pkcs11:token=a for user 0";
        EXPECT_THAT(line.text, Not(HasSubstr("123456")));
        EXPECT_THAT(line.text, Not(HasSubstr("98765")));
    }
    EXPECT_TRUE(isTold);
}

}  // namespace
}  // namespace vlm::service
