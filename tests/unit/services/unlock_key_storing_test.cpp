// Storing an unlock key: what is refused at once, whom it asks, and what is in the database then.

#include <gmock/gmock.h>

#include "hints_service_fixture.h"
#include "keychain/card_key.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

// Alice is paired with key 1 of a card whose wrap key is a real one.
class UnlockKeyStoringTest : public HintsServiceTest {
protected:
    UnlockKeyStoringTest() {
        pairings.pair("alice", hashOf(1), kNow);
        insertCard();
    }

    void insertCard() { tokens.insert(card()); }
    Token card() const {
        Identity wrapping = identityOf(9, "Alice (wrap)");
        wrapping.publicKeyHash = wrapKey.hash();
        wrapping.publicKeyInfo = wrapKey.publicInfo();
        auto token = tokenOf("pkcs11:token=a", "Card A", {identityOf(1, "Alice"), wrapping});
        token.wrapKeyHash = wrapKey.hash();
        token.wrapScheme = WrapScheme::Ecdh;
        return token;
    }

    IncomingRequest store(platform::UserId user = 1000) const {
        return requestOf(9, {{"uid", signedNumber(user)},
                             {"dat1", hashOf(1)},
                             {"dat2", wrapKey.hash()},
                             {"str1", "pkcs11:token=a"},
                             {"str2", "/keyring/login"},
                             {"str3", text("")}});
    }
    IncomingRequest storeWith(const std::string& key, const platform::Message::Value& value) const {
        auto request = store();
        request.message.set(key, value);
        return request;
    }
    std::optional<UnlockKey> stored() { return *pairings.unlockKey("alice", hashOf(1)); }
    // What the card would make of what is stored.
    std::string opened() {
        const auto key = stored();
        if (!key) return "(nothing is stored)";
        const auto task = cardTask(key->wrapped, key->wrapKeyHash);
        const auto secret = task ? wrapKey.open(*task) : std::nullopt;
        const auto password =
            secret ? unwrapUnlockKey(key->wrapped, *secret, {"alice", hashOf(1), wrapKey.hash()})
                   : std::nullopt;
        return password ? std::string(password->text()) : "(it cannot be opened)";
    }
    bool asked() const { return !keyrings.questions.empty(); }
    void expectRefusedUnasked(const IncomingRequest& request, platform::Status status) {
        EXPECT_EQ(result(ask(alice(), request)), status);
        EXPECT_FALSE(asked());
        EXPECT_FALSE(stored());
    }

    CardKey wrapKey{"P-256"};
};

TEST_F(UnlockKeyStoringTest, AsksTheUserOnceAndStoresWhatOnlyTheCardOpens) {
    ASSERT_FALSE(ask(alice(), store()));
    ASSERT_EQ(keyrings.questions.size(), 1u);
    EXPECT_EQ(keyrings.users, (std::vector<platform::UserId>{1000}));
    EXPECT_EQ(keyrings.questions[0].card, "Card A");
    EXPECT_EQ(keyrings.questions[0].account, "alice");
    EXPECT_EQ(keyrings.questions[0].keyring, "/keyring/login");

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_EQ(opened(), "open sesame");
    EXPECT_EQ(stored()->wrapPublicInfo, wrapKey.publicInfo());
}

TEST_F(UnlockKeyStoringTest, AsksTheUserOfWhomRootSpeaks) {
    ask(root(), store());
    ASSERT_EQ(keyrings.users, (std::vector<platform::UserId>{1000}));

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_EQ(opened(), "open sesame");
}

TEST_F(UnlockKeyStoringTest, LogsOneLineThatHoldsNoSecret) {
    ask(alice(), store());
    keyrings.enter("open sesame");

    const auto lines = log().texts(platform::LogLevel::Default);
    ASSERT_EQ(lines.size(), 1u);
    EXPECT_THAT(lines[0], StartsWith("stored the unlock key of alice for 0101"));
    for (const auto& line : log().lines()) EXPECT_THAT(line.text, Not(HasSubstr("sesame")));
}

TEST_F(UnlockKeyStoringTest, ReplacesTheOneThatIsThere) {
    for (const auto* password : {"before", "after"}) {
        ask(alice(), store());
        keyrings.enter(password);
    }

    EXPECT_EQ(opened(), "after");
    EXPECT_EQ(pairings.unlockKeysOf("alice")->size(), 1u);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyForAnotherUser) {
    expectRefusedUnasked(store(1001), status::kNotPermitted);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyForAUserWhoIsNone) {
    EXPECT_EQ(result(ask(root(), store(4711))), status::kNoSuchAccount);
    expectRefusedUnasked(storeWith("uid", signedNumber(-1)), status::kNoSuchAccount);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyWithoutThePairing) {
    expectRefusedUnasked(storeWith("dat1", hashOf(2)), status::kNotPaired);
    pairings.pair("bob", hashOf(2), kNow);
    expectRefusedUnasked(storeWith("dat1", hashOf(2)), status::kNotPaired);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyWithoutTheCard) {
    expectRefusedUnasked(storeWith("str1", text("pkcs11:token=b")), status::kNoSuchToken);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyForACardThatDoesNotHoldThePairedKey) {
    pairings.pair("alice", hashOf(2), kNow);

    expectRefusedUnasked(storeWith("dat1", hashOf(2)), status::kNoSuchKey);
}

TEST_F(UnlockKeyStoringTest, AsksNobodyForACardWithoutAWrapKey) {
    tokens.pull("pkcs11:token=a");
    auto plain = card();
    plain.wrapKeyHash.reset();
    tokens.insert(plain);

    expectRefusedUnasked(store(), status::kNoWrapKey);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("no key that can protect a password"));
}

TEST_F(UnlockKeyStoringTest, AsksNobodyWhenTheWrapKeyIsAnotherOne) {
    expectRefusedUnasked(storeWith("dat2", hashOf(1)), status::kNoWrapKey);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("another one"));
}

TEST_F(UnlockKeyStoringTest, AsksNobodyWhenThePairingsCannotBeRead) {
    pairings.breakDown("the disk is gone");

    EXPECT_EQ(result(ask(alice(), store())), status::kStoreFailed);
    EXPECT_FALSE(asked());
}

TEST_F(UnlockKeyStoringTest, StoresNothingWithoutAPassword) {
    for (const auto status : {status::kNoKeyring, status::kKeyringRefused, status::kCancelled}) {
        ask(alice(), store());

        keyrings.refuse({status, "for a reason."});

        EXPECT_EQ(result(lastReply()), status);
        EXPECT_THAT(errorText(lastReply()),
                    AllOf(StartsWith("Storing the key that opens the login keyring of user 1000"),
                          HasSubstr(": for a reason.")));
        EXPECT_FALSE(stored());
    }
}

TEST_F(UnlockKeyStoringTest, StoresNothingWhenThePairingIsGoneByThen) {
    ask(alice(), store());
    pairings.unpair("alice", hashOf(1));

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), status::kNotPaired);
    EXPECT_FALSE(stored());
}

TEST_F(UnlockKeyStoringTest, StoresNothingWhenTheNameIsAnothersByThen) {
    ask(alice(), store());
    accounts().add("alicia", 1000);
    ASSERT_EQ(accounts().userName(1000), "alicia");

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), status::kNoSuchAccount);
    EXPECT_FALSE(stored());
}

TEST_F(UnlockKeyStoringTest, StoresAlsoWhenTheCardIsPulledMeanwhile) {
    ask(alice(), store());
    tokens.pull("pkcs11:token=a");

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), 0);
    EXPECT_EQ(opened(), "open sesame");
}

TEST_F(UnlockKeyStoringTest, SaysSoWhenTheKeyCannotBeWrappedWith) {
    tokens.pull("pkcs11:token=a");
    auto broken = card();
    broken.identities[1].publicKeyInfo = Bytes{1, 2, 3};
    tokens.insert(broken);
    ask(alice(), store());

    keyrings.enter("open sesame");

    EXPECT_EQ(result(lastReply()), status::kNoWrapKey);
    EXPECT_FALSE(stored());
}

TEST_F(UnlockKeyStoringTest, WithdrawsTheQuestionOfACallerWhoLeft) {
    ask(alice(), store());
    ASSERT_EQ(keyrings.passwords.count(), 1u);

    callers.leave(alice().connection);

    EXPECT_EQ(keyrings.passwords.count(), 0u);
    EXPECT_FALSE(lastReply());
}

TEST_F(UnlockKeyStoringTest, AsksNothingForACallerWhoLeftBeforeTheCardAnswered) {
    send(alice(), store());

    callers.leave(alice().connection);
    settle();

    EXPECT_FALSE(asked());
}

TEST_F(UnlockKeyStoringTest, ServesOthersWhileAPersonTypes) {
    ask(alice(), store());

    EXPECT_EQ(result(ask(root(), requestOf(6, {{"str1", "alice"}}))), 1);
    EXPECT_EQ(keyrings.passwords.count(), 1u);
}

}  // namespace
}  // namespace vlm::service
