#include "services/hints/keyring_password.h"

#include <gmock/gmock.h>

#include "fake_login_keyring.h"
#include "fake_password_prompt.h"
#include "platform_test.h"
#include "services/hints/keyring_unlocking.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

class KeyringPasswordTest : public fakes::PlatformTest {
protected:
    void begin(const std::string& path = "/keyring/login") {
        password.emplace(prompt, keyring, KeyringQuestion{"Card A", "alice", path},
                         [this](Outcome<Secret> given) {
                             EXPECT_FALSE(outcome) << "it is answered once";
                             outcome.emplace(std::move(given));
                         });
        EXPECT_FALSE(outcome) << "never before the constructor has ended";
        keyring.settle();
    }
    void enter(const std::string& text) {
        prompt.enter(text);
        keyring.settle();
    }
    std::string given() const {
        return outcome && *outcome ? std::string((**outcome).text()) : "(none)";
    }
    platform::Status refusal() const {
        return outcome && !*outcome ? outcome->refusal().status : 0;
    }
    bool noticed(const std::string& part) {
        for (const auto& line : log().texts(platform::LogLevel::Default))
            if (line.find(part) != std::string::npos) return true;
        return false;
    }

    fakes::FakePasswordPrompt prompt;
    fakes::FakeLoginKeyring keyring;
    std::optional<Outcome<Secret>> outcome;
    std::optional<KeyringPassword> password;
};

TEST_F(KeyringPasswordTest, IsAskedForOnceAndTried) {
    keyring.makeOne("open sesame");
    begin();
    ASSERT_EQ(prompt.questions.size(), 1u);
    EXPECT_EQ(prompt.questions[0].card, "Card A");
    EXPECT_EQ(prompt.questions[0].account, "alice");
    EXPECT_FALSE(prompt.questions[0].wasRefused);
    EXPECT_FALSE(prompt.questions[0].isTypedTwice);

    enter("open sesame");

    EXPECT_EQ(given(), "open sesame");
    EXPECT_EQ(keyring.tried, (std::vector<std::string>{"open sesame"}));
    EXPECT_EQ(prompt.questions.size(), 1u);
}

TEST_F(KeyringPasswordTest, IsAskedForAgainAfterAWrongOne) {
    keyring.makeOne("open sesame");
    begin();

    enter("wrong");
    ASSERT_EQ(prompt.questions.size(), 2u);
    EXPECT_TRUE(prompt.questions[1].wasRefused);
    enter("open sesame");

    EXPECT_EQ(given(), "open sesame");
}

TEST_F(KeyringPasswordTest, IsAskedForThreeTimesAtMost) {
    keyring.makeOne("open sesame");
    begin();

    for (const auto* wrong : {"one", "two", "three"}) enter(wrong);

    EXPECT_EQ(refusal(), status::kKeyringRefused);
    EXPECT_EQ(prompt.questions.size(), 3u);
    EXPECT_EQ(keyring.tried.size(), 3u);
}

TEST_F(KeyringPasswordTest, IsAskedForByNobodyWithoutAKeyring) {
    begin();

    EXPECT_EQ(refusal(), status::kNoKeyring);
    EXPECT_TRUE(prompt.questions.empty());
}

TEST_F(KeyringPasswordTest, IsAskedForByNobodyForAnotherKeyring) {
    keyring.makeOne("open sesame");

    begin("/keyring/other");

    EXPECT_EQ(refusal(), status::kNoKeyring);
    EXPECT_TRUE(prompt.questions.empty());
}

TEST_F(KeyringPasswordTest, IsTypedTwiceWhereNothingChecksItAndTheLogSaysSo) {
    keyring.makeOne("open sesame");
    keyring.checkNothing();
    begin();
    ASSERT_EQ(prompt.questions.size(), 1u);
    EXPECT_TRUE(prompt.questions[0].isTypedTwice);
    EXPECT_TRUE(noticed("checks no password"));

    enter("whatever");

    EXPECT_EQ(given(), "whatever");
    EXPECT_TRUE(keyring.tried.empty()) << "it might make a keyring";
}

TEST_F(KeyringPasswordTest, IsNoneWhenThePersonDoesNotGiveIt) {
    keyring.makeOne("open sesame");
    begin();
    prompt.cancel();
    EXPECT_EQ(refusal(), status::kCancelled);

    outcome.reset();
    begin();
    prompt.stayAway();
    EXPECT_EQ(refusal(), status::kCancelled);

    outcome.reset();
    begin();
    prompt.beUnreachable("there is no screen");
    EXPECT_EQ(refusal(), status::kNoKeyring);
    EXPECT_THAT(outcome->refusal().text, HasSubstr("there is no screen"));
}

TEST_F(KeyringPasswordTest, IsNoneWhenTheKeyringDoesNotAnswer) {
    keyring.makeOne("open sesame");
    keyring.fail();
    begin();

    enter("open sesame");

    EXPECT_EQ(refusal(), status::kNoKeyring);
    EXPECT_EQ(prompt.questions.size(), 1u) << "asking again would not help";
}

TEST_F(KeyringPasswordTest, IsWithdrawnAtEachStep) {
    keyring.makeOne("open sesame");
    begin();
    password.reset();
    EXPECT_EQ(prompt.open(), 0u);

    begin();
    keyring.hang();
    enter("open sesame");
    EXPECT_EQ(keyring.open(), 1u);
    password.reset();
    EXPECT_EQ(keyring.open(), 0u);
    EXPECT_FALSE(outcome);
}

TEST_F(KeyringPasswordTest, MayBeDroppedByItsOwnAnswer) {
    keyring.makeOne("open sesame");
    auto dropped = std::make_unique<std::optional<KeyringPassword>>();
    dropped->emplace(prompt, keyring, KeyringQuestion{"Card A", "alice", "/keyring/login"},
                     [&](const Outcome<Secret>&) { dropped.reset(); });
    keyring.settle();

    enter("open sesame");

    EXPECT_FALSE(dropped);
}

TEST_F(KeyringPasswordTest, IsInNoLine) {
    keyring.makeOne("open sesame");
    begin();
    enter("shut sesame");
    enter("open sesame");

    for (const auto& line : log().lines()) EXPECT_THAT(line.text, Not(HasSubstr("sesame")));
}

class KeyringUnlockingTest : public fakes::PlatformTest {
protected:
    void unlock(const std::string& text) {
        unlocking.emplace(keyring, Secret(text), [this](const std::optional<Refusal>& refusal) {
            answers.push_back(refusal ? refusal->status : 0);
        });
        EXPECT_TRUE(answers.empty());
        keyring.settle();
    }

    fakes::FakeLoginKeyring keyring;
    std::vector<platform::Status> answers;
    std::optional<KeyringUnlocking> unlocking;
};

TEST_F(KeyringUnlockingTest, GivesTheKeyringThePassword) {
    keyring.makeOne("open sesame");

    unlock("open sesame");

    EXPECT_EQ(answers, (std::vector<platform::Status>{0}));
}

TEST_F(KeyringUnlockingTest, TellsThatItWasRefused) {
    keyring.makeOne("open sesame");

    unlock("wrong");

    EXPECT_EQ(answers, (std::vector<platform::Status>{status::kKeyringRefused}));
    EXPECT_EQ(keyring.tried.size(), 1u) << "it is tried once";
}

TEST_F(KeyringUnlockingTest, GivesNoPasswordWhereThereIsNoKeyringThatTakesOne) {
    unlock("open sesame");
    EXPECT_EQ(answers, (std::vector<platform::Status>{status::kNoKeyring}));

    answers.clear();
    keyring.makeOne("open sesame");
    keyring.checkNothing();
    unlock("open sesame");
    EXPECT_EQ(answers, (std::vector<platform::Status>{status::kNoKeyring}));
    EXPECT_TRUE(keyring.tried.empty());
}

TEST_F(KeyringUnlockingTest, TellsThatTheKeyringDoesNotAnswer) {
    keyring.makeOne("open sesame");
    keyring.fail();

    unlock("open sesame");

    EXPECT_EQ(answers, (std::vector<platform::Status>{status::kNoKeyring}));
}

TEST_F(KeyringUnlockingTest, IsGivenUpWhenItIsDropped) {
    keyring.makeOne("open sesame");
    keyring.hang();
    unlock("open sesame");

    unlocking.reset();

    EXPECT_EQ(keyring.open(), 0u);
    EXPECT_TRUE(answers.empty());
}

}  // namespace
}  // namespace vlm::service
