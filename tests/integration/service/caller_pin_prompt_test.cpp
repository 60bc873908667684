// Where the daemon asks for a PIN when it has just started and when it is about to end, with a
// user's instance in the test's hands and a time that the test moves.

#include "services/hints/caller_pin_prompt.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "bus_test.h"
#include "services/hints/bus_caller_watch.h"
#include "services/hints/bus_server.h"
#include "services/hints/prompter_messages.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

// Root is asked for nowhere, so root's instance would not do.
uid_t consoleUser() { return geteuid() == 0 ? 65534 : geteuid(); }

class CallerPinPromptTest : public BusTest {
protected:
    CallerPinPromptTest() {
        sessions().login(consoleUser(), /*onConsole=*/true);
        EXPECT_TRUE(registry.start());
    }

    void ask() {
        question = prompt.ask({"Card", "Alice", PinState::Ready, "", {0, 0, ":1.99"}},
                              [this](PinAnswer given) { answer = std::move(given); });
    }
    // The bus knows a connection by the user who made it.
    platform::SdBus connectAsConsoleUser() {
        const auto before = geteuid();
        EXPECT_EQ(seteuid(consoleUser()), 0);
        auto connection = connect();
        EXPECT_EQ(seteuid(before), 0);
        return connection;
    }
    void registerInstance() {
        instanceBus = connectAsConsoleUser();
        instance =
            std::make_unique<BusServer>(instanceBus.get(), kPrompterInterface,
                                        std::vector<BusServer::Method>{{"AskPin", exchanges}});
        ASSERT_TRUE(instance->start());
        ASSERT_GE(sd_bus_call_method_async(
                      instanceBus.get(), nullptr, nameOf(daemonBus.get()).c_str(), kObjectPath,
                      kPromptersInterface, "RegisterPrompter", nullptr, nullptr, ""),
                  0);
    }

    std::int64_t now = 50'000;  // milliseconds

    PatientExchanges exchanges;
    platform::SdBus instanceBus;
    std::unique_ptr<BusServer> instance;

    platform::SdBus daemonBus = connect();
    BusCallerWatch callers{daemonBus.get()};
    PrompterRegistry registry{daemonBus.get(), callers, [this] { return now; }};
    CallerPinPrompt prompt{event(), registry, ""};
    std::optional<PinAnswer> answer;
    std::unique_ptr<PinPrompt::Question> question;
};

TEST_F(CallerPinPromptTest, WaitsForTheUsersInstanceWhenTheDaemonHasJustStarted) {
    now += 1;
    ask();
    runUntilQuiet();
    EXPECT_FALSE(answer);

    registerInstance();
    runUntil([&] { return !exchanges.waiting.empty(); });
    exchanges.waiting[0].reply(writeAnswer({PinAnswer::Outcome::Given, Secret("123456"), {}}));
    runUntil([&] { return answer.has_value(); });

    EXPECT_EQ(answer->outcome, PinAnswer::Outcome::Given);
    EXPECT_EQ(answer->pin.text(), "123456");
}

TEST_F(CallerPinPromptTest, SaysThatNobodyIsThereWhenTheTimeToRegisterIsOver) {
    now += 1'950;
    ask();

    runUntil([&] { return answer.has_value(); });

    EXPECT_EQ(answer->outcome, PinAnswer::Outcome::Unavailable);
    EXPECT_THAT(answer->reason, HasSubstr("no desktop to ask on"));
}

TEST_F(CallerPinPromptTest, WaitsForNobodyLater) {
    now += 2'000;
    ask();

    runUntilQuiet();

    ASSERT_TRUE(answer);
    EXPECT_EQ(answer->outcome, PinAnswer::Outcome::Unavailable);
}

TEST_F(CallerPinPromptTest, AsksNobodyWhenTheQuestionIsWithdrawnWhileItWaits) {
    ask();
    question.reset();

    registerInstance();
    runUntilQuiet();

    EXPECT_TRUE(exchanges.waiting.empty());
    EXPECT_FALSE(answer);
}

TEST_F(CallerPinPromptTest, AsksNobodyWhenTheDaemonIsAboutToEnd) {
    registerInstance();
    runUntilQuiet();

    prompt.askNobody();
    ask();
    runUntil([&] { return answer.has_value(); });

    EXPECT_EQ(answer->outcome, PinAnswer::Outcome::Unavailable);
    EXPECT_THAT(answer->reason, HasSubstr("Try again"));
    EXPECT_TRUE(exchanges.waiting.empty());
}

}  // namespace
}  // namespace vlm::service
