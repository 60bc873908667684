#include "services/hints/unlock_key_changes.h"

#include <gmock/gmock.h>

#include "hints_service_fixture.h"
#include "keychain/card_key.h"
#include "services/hints/secret_pipe.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

class UnlockKeyChangesTest : public HintsServiceTest {
protected:
    // Pairs the account and stores a password that this card opens.
    void store(const std::string& account, std::uint8_t hash, const CardKey& card,
               WrapScheme scheme) {
        pairings.pair(account, hashOf(hash), kNow);
        auto wrapped = wrapUnlockKey(Secret("before"), {account, hashOf(hash), card.hash()},
                                     card.publicInfo(), scheme);
        ASSERT_TRUE(wrapped);
        ASSERT_FALSE(pairings.storeUnlockKey(
            {account, hashOf(hash), card.hash(), card.publicInfo(), *wrapped}));
    }
    std::string opened(const std::string& account, std::uint8_t hash, const CardKey& card) {
        const auto key = *pairings.unlockKey(account, hashOf(hash));
        if (!key) return "(nothing is stored)";
        const auto task = cardTask(key->wrapped, key->wrapKeyHash);
        const auto secret = task ? card.open(*task) : std::nullopt;
        const auto password =
            secret ? unwrapUnlockKey(key->wrapped, *secret, {account, hashOf(hash), card.hash()})
                   : std::nullopt;
        return password ? std::string(password->text()) : "(it cannot be opened)";
    }
    static IncomingRequest changed(const std::string& account, const std::string& password) {
        return requestOf(13, {{"str1", account}, {"dat1", *pipeHolding(Secret(password))}});
    }
    static IncomingRequest erase(const std::string& account, std::uint8_t hash) {
        return requestOf(10, {{"str1", account}, {"dat1", hashOf(hash)}});
    }

    CardKey ec{"P-256"};
    // It takes long to make one.
    static const CardKey& rsa() {
        static const CardKey key("RSA-2048");
        return key;
    }
};

TEST_F(UnlockKeyChangesTest, WrapsANewPasswordForEveryCardOfTheAccount) {
    store("alice", 1, ec, WrapScheme::Ecdh);
    store("alice", 2, rsa(), WrapScheme::RsaOaepSha256);
    store("bob", 1, ec, WrapScheme::Ecdh);

    const auto reply = ask(root(), changed("alice", "after"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(reply->integer("num1"), 2);
    EXPECT_EQ(opened("alice", 1, ec), "after");
    EXPECT_EQ(opened("alice", 2, rsa()), "after");
    EXPECT_EQ(opened("bob", 1, ec), "before");
}

TEST_F(UnlockKeyChangesTest, KeepsTheWayInWhichACardOpens) {
    store("alice", 1, rsa(), WrapScheme::RsaPkcs1);

    ask(root(), changed("alice", "after"));

    const auto key = *pairings.unlockKey("alice", hashOf(1));
    EXPECT_EQ(cardTask(key->wrapped, key->wrapKeyHash)->scheme, WrapScheme::RsaPkcs1);
    EXPECT_EQ(opened("alice", 1, rsa()), "after");
}

TEST_F(UnlockKeyChangesTest, LogsOneLineThatHoldsNoSecret) {
    store("alice", 1, ec, WrapScheme::Ecdh);

    ask(root(), changed("alice", "open sesame"));

    EXPECT_THAT(log().texts(platform::LogLevel::Default),
                testing::ElementsAre("wrapped the new password of alice for 1 cards for user 0"));
    for (const auto& line : log().lines()) EXPECT_THAT(line.text, Not(HasSubstr("sesame")));
}

TEST_F(UnlockKeyChangesTest, SaysOfAnAccountWithoutUnlockKeysThatThereWasNothingToDo) {
    const auto reply = ask(root(), changed("alice", "after"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(reply->integer("num1"), 0);
    EXPECT_TRUE(log().texts(platform::LogLevel::Default).empty());
}

TEST_F(UnlockKeyChangesTest, ChangesAllOrNone) {
    store("alice", 1, ec, WrapScheme::Ecdh);
    store("alice", 2, ec, WrapScheme::Ecdh);
    auto broken = **pairings.unlockKey("alice", hashOf(2));
    broken.wrapPublicInfo = Bytes{1};
    pairings.storeUnlockKey(broken);

    EXPECT_EQ(result(ask(root(), changed("alice", "after"))), status::kNoWrapKey);

    EXPECT_EQ(opened("alice", 1, ec), "before");
}

TEST_F(UnlockKeyChangesTest, TellsOfAStoreThatCannotBeWritten) {
    pairings.breakDown("the disk is gone");

    EXPECT_EQ(result(ask(root(), changed("alice", "after"))), status::kStoreFailed);
    EXPECT_EQ(result(ask(root(), erase("alice", 1))), status::kStoreFailed);
}

TEST_F(UnlockKeyChangesTest, AreTheOwnAccountsOnly) {
    store("bob", 1, ec, WrapScheme::Ecdh);

    EXPECT_EQ(result(ask(alice(), changed("bob", "after"))), status::kNotPermitted);
    EXPECT_EQ(result(ask(alice(), erase("bob", 1))), status::kNotPermitted);
    EXPECT_EQ(opened("bob", 1, ec), "before");

    store("alice", 1, ec, WrapScheme::Ecdh);
    EXPECT_EQ(result(ask(alice(), changed("alice", "after"))), 0);
    EXPECT_EQ(opened("alice", 1, ec), "after");
}

TEST_F(UnlockKeyChangesTest, KnowsNoPasswordOfAnAccountThatIsNone) {
    EXPECT_EQ(result(ask(root(), changed("mallory", "after"))), status::kNoSuchAccount);
}

TEST_F(UnlockKeyChangesTest, ErasesOneAndLeavesThePairing) {
    store("alice", 1, ec, WrapScheme::Ecdh);
    store("alice", 2, ec, WrapScheme::Ecdh);

    EXPECT_EQ(result(ask(alice(), erase("alice", 1))), 0);

    EXPECT_EQ(opened("alice", 1, ec), "(nothing is stored)");
    EXPECT_EQ(opened("alice", 2, ec), "before");
    EXPECT_EQ(pairings.all().size(), 2u);
    EXPECT_THAT(log().texts(platform::LogLevel::Default),
                testing::ElementsAre(testing::StartsWith("erased the unlock key of alice")));
}

TEST_F(UnlockKeyChangesTest, AreContentWhenThereIsNothingToErase) {
    EXPECT_EQ(result(ask(alice(), erase("alice", 1))), 0);
    EXPECT_EQ(result(ask(root(), erase("gone", 1))), 0);
    EXPECT_TRUE(log().texts(platform::LogLevel::Default).empty());
}

TEST_F(UnlockKeyChangesTest, GoWithTheirPairing) {
    store("alice", 1, ec, WrapScheme::Ecdh);

    EXPECT_EQ(result(ask(root(), unpair("alice", 1))), 0);

    EXPECT_EQ(opened("alice", 1, ec), "(nothing is stored)");
}

}  // namespace
}  // namespace vlm::service
