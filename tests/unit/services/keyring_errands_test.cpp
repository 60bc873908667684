#include "services/hints/keyring_errands.h"

#include <gmock/gmock.h>

#include "fake_caller_watch.h"
#include "fake_login_keyring.h"
#include "fake_password_prompt.h"
#include "platform_test.h"
#include "services/hints/keyring_messages.h"
#include "services/hints/reply.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

class KeyringErrandsTest : public fakes::PlatformTest {
protected:
    void ask(Exchanges& errand, const Caller& caller, const platform::Message& request) {
        errand.handle(caller, {request, {}},
                      [this](platform::Message reply) { replies.push_back(std::move(reply)); });
        keyring.settle();
    }
    std::optional<std::int64_t> result() const {
        EXPECT_LE(replies.size(), 1u);
        return replies.empty() ? std::nullopt : replies[0].integer("res");
    }

    const Caller daemon{0, 1, ":1.1"};
    const Caller alice{1000, 2, ":1.2"};
    const platform::Message question = writeKeyringQuestion({"Card A", "alice", "/keyring/login"});
    const platform::Message unlocking = *writeUnlocking(Secret("open sesame"));
    fakes::FakePasswordPrompt prompt;
    fakes::FakeLoginKeyring keyring;
    fakes::FakeCallerWatch callers;
    KeyringNaming naming{keyring, callers};
    KeyringPasswordAsking asking{prompt, keyring, callers};
    KeyringOpening opening{keyring, callers};
    std::vector<platform::Message> replies;
};

TEST_F(KeyringErrandsTest, NameTheKeyring) {
    keyring.makeOne("open sesame");

    ask(naming, daemon, {});

    ASSERT_EQ(result(), 0);
    EXPECT_EQ(*readKeyringName(replies[0]), "/keyring/login");
}

TEST_F(KeyringErrandsTest, SayThatThereIsNoKeyring) {
    ask(naming, daemon, {});

    EXPECT_EQ(result(), status::kNoKeyring);
}

TEST_F(KeyringErrandsTest, GiveThePasswordInAPipe) {
    keyring.makeOne("open sesame");
    ask(asking, daemon, question);
    prompt.enter("open sesame");
    keyring.settle();

    ASSERT_EQ(result(), 0);
    for (const auto& [key, value] : replies[0].entries())
        EXPECT_FALSE(std::holds_alternative<std::string>(value)) << key;
    EXPECT_EQ((*readKeyringPassword(replies[0])).text(), "open sesame");
}

TEST_F(KeyringErrandsTest, OpenTheKeyring) {
    keyring.makeOne("open sesame");

    ask(opening, daemon, unlocking);

    EXPECT_EQ(result(), 0);
    EXPECT_EQ(keyring.tried, (std::vector<std::string>{"open sesame"}));
}

TEST_F(KeyringErrandsTest, AreDoneForTheDaemonOnly) {
    keyring.makeOne("open sesame");
    for (Exchanges* errand : {static_cast<Exchanges*>(&naming), static_cast<Exchanges*>(&asking),
                              static_cast<Exchanges*>(&opening)}) {
        replies.clear();

        ask(*errand, alice, question);

        EXPECT_EQ(result(), status::kNotPermitted);
    }
    EXPECT_TRUE(prompt.questions.empty());
    EXPECT_TRUE(keyring.tried.empty());
}

TEST_F(KeyringErrandsTest, RefuseQuestionsThatAreNone) {
    ask(asking, daemon, {});
    EXPECT_EQ(result(), status::kBadRequest);

    replies.clear();
    ask(opening, daemon, question);
    EXPECT_EQ(result(), status::kBadRequest);
}

TEST_F(KeyringErrandsTest, AreGivenUpWithTheDaemon) {
    keyring.makeOne("open sesame");
    ask(asking, daemon, question);
    ASSERT_EQ(prompt.open(), 1u);

    callers.leave(daemon.connection);

    EXPECT_EQ(prompt.open(), 0u);
    EXPECT_TRUE(replies.empty());
}

struct Hostile {
    const char* why;
    std::vector<platform::Message::Entry> entries;
};

platform::Message messageOf(const Hostile& hostile) {
    platform::Message message;
    for (const auto& [key, value] : hostile.entries) message.set(key, value);
    return message;
}

TEST(KeyringMessagesTest, CarryARefusalWithItsReason) {
    for (const auto status : {status::kNoKeyring, status::kKeyringRefused, status::kCancelled}) {
        const auto reply = refusalReply({status, "for a reason."});

        EXPECT_EQ(readRefusal(reply), (Refusal{status, "for a reason."}));
        EXPECT_EQ(readKeyringName(reply).refusal().status, status);
        EXPECT_EQ(readKeyringPassword(reply).refusal().status, status);
    }
    EXPECT_EQ(readRefusal(numberReply(0)), std::nullopt);
}

TEST(KeyringMessagesTest, LetNoUsersInstanceSpeakForTheDaemon) {
    const auto refusal = readRefusal(refusalReply({status::kNotPaired, "They are not paired."}));

    ASSERT_TRUE(refusal);
    EXPECT_EQ(refusal->status, status::kNoKeyring);
}

TEST(KeyringMessagesTest, TakeNothingElseForAnAnswer) {
    const auto longPassword = *pipeHolding(Secret(std::string(1025, 'x')));
    const Hostile answers[] = {
        {"nothing", {}},
        {"no content", {{"res", std::int64_t{0}}}},
        {"a password as text", {{"res", std::int64_t{0}}, {"password", std::string("1")}}},
        {"a password that is too long", {{"res", std::int64_t{0}}, {"password", longPassword}}},
        {"an empty name", {{"res", std::int64_t{0}}, {"str1", std::string()}}},
        {"a name that is too long", {{"res", std::int64_t{0}}, {"str1", std::string(4097, 'x')}}},
        {"a failure without an error", {{"res", std::int64_t{-2021}}, {"str1", std::string("/a")}}},
    };
    for (const auto& hostile : answers) {
        SCOPED_TRACE(hostile.why);
        const auto message = messageOf(hostile);

        EXPECT_FALSE(readKeyringName(message));
        EXPECT_FALSE(readKeyringPassword(message));
    }
}

TEST(KeyringMessagesTest, TakeNothingElseForAQuestion) {
    const Hostile questions[] = {
        {"nothing", {}},
        {"no card", {{"account", std::string("a")}, {"str2", std::string("/a")}}},
        {"an empty account",
         {{"card", std::string("c")}, {"account", std::string()}, {"str2", std::string("/a")}}},
        {"a card that is too long",
         {{"card", std::string(4097, 'c')},
          {"account", std::string("a")},
          {"str2", std::string("/a")}}},
    };
    for (const auto& hostile : questions)
        EXPECT_FALSE(readKeyringQuestion(messageOf(hostile))) << hostile.why;
}

}  // namespace
}  // namespace vlm::service
