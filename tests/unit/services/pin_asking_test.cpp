#include "services/hints/pin_asking.h"

#include <gmock/gmock.h>

#include "fake_caller_watch.h"
#include "fake_pin_prompt.h"
#include "platform_test.h"
#include "services/hints/prompter_messages.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

class PinAskingTest : public fakes::PlatformTest {
protected:
    void ask(const Caller& caller, const platform::Message& question) {
        asking.handle(caller, {question, {}},
                      [this](platform::Message reply) { replies.push_back(std::move(reply)); });
    }

    static platform::Message question() {
        return writeQuestion({"PIV Card", "Alice", PinState::LastTry, "alice", {}});
    }

    const Caller daemon{0, 1, ":1.1"};
    fakes::FakePinPrompt prompt;
    fakes::FakeCallerWatch callers;
    PinAsking asking{prompt, callers};
    std::vector<platform::Message> replies;
};

TEST_F(PinAskingTest, AsksForTheDaemon) {
    ask(daemon, question());
    ASSERT_EQ(prompt.questions.size(), 1u);
    EXPECT_EQ(prompt.questions[0].card, "PIV Card");
    EXPECT_EQ(prompt.questions[0].identity, "Alice");
    EXPECT_EQ(prompt.questions[0].state, PinState::LastTry);
    EXPECT_EQ(prompt.questions[0].account, "alice");

    prompt.enter("123456");

    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(readAnswer(replies[0]).pin.text(), "123456");
}

TEST_F(PinAskingTest, AsksForNobodyElse) {
    ask({1000, 2, ":1.2"}, question());

    EXPECT_TRUE(prompt.questions.empty());
    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(replies[0].integer("res"), status::kNotPermitted);
}

TEST_F(PinAskingTest, RefusesAQuestionThatIsNone) {
    auto message = question();
    message.set("state", std::uint64_t{4});

    ask(daemon, message);

    EXPECT_TRUE(prompt.questions.empty());
    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(replies[0].integer("res"), status::kBadRequest);
}

TEST_F(PinAskingTest, WithdrawsTheQuestionWhenTheDaemonGivesItUp) {
    ask(daemon, question());

    callers.leave(daemon.connection);

    EXPECT_EQ(prompt.open(), 0u);
    EXPECT_TRUE(replies.empty());
}

TEST(PrompterMessagesTest, CarryEveryAnswer) {
    using Outcome = PinAnswer::Outcome;

    EXPECT_EQ(readAnswer(writeAnswer({Outcome::Given, Secret("12"), {}})).pin.text(), "12");
    EXPECT_EQ(readAnswer(writeAnswer({Outcome::Cancelled, {}, {}})).outcome, Outcome::Cancelled);
    const auto unavailable = readAnswer(writeAnswer({Outcome::Unavailable, {}, "no desktop"}));
    EXPECT_EQ(unavailable.outcome, Outcome::Unavailable);
    EXPECT_EQ(unavailable.reason, "no desktop");
}

struct Hostile {
    const char* why;
    std::vector<platform::Message::Entry> entries;
};

TEST(PrompterMessagesTest, TakeNothingElseForAPin) {
    const Hostile answers[] = {
        {"nothing", {}},
        {"no PIN", {{"res", std::int64_t{0}}}},
        {"an empty PIN", {{"res", std::int64_t{0}}, {"pin", std::string()}}},
        {"a PIN as bytes", {{"res", std::int64_t{0}}, {"pin", platform::Bytes{'1'}}}},
        {"a PIN that is too long", {{"res", std::int64_t{0}}, {"pin", std::string(257, '1')}}},
        {"a PIN with a failure", {{"res", std::int64_t{-1}}, {"pin", std::string("1")}}},
        {"an unsigned status", {{"res", std::uint64_t{0}}, {"pin", std::string("1")}}},
    };
    for (const auto& [why, entries] : answers) {
        SCOPED_TRACE(why);
        platform::Message message;
        for (const auto& [key, value] : entries) message.set(key, value);

        const auto answer = readAnswer(message);

        EXPECT_EQ(answer.outcome, PinAnswer::Outcome::Unavailable);
        EXPECT_TRUE(answer.pin.empty());
        EXPECT_FALSE(answer.reason.empty());
    }
}

}  // namespace
}  // namespace vlm::service
