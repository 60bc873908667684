// How the daemon reaches a user's keyring, with the user's instance in the test's hands.

#include "services/hints/bus_user_keyrings.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "bus_test.h"
#include "services/hints/bus_caller_watch.h"
#include "services/hints/bus_server.h"
#include "services/hints/keyring_messages.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using namespace std::chrono_literals;
using testing::HasSubstr;

class BusUserKeyringsTest : public BusTest {
protected:
    BusUserKeyringsTest() { EXPECT_TRUE(registry.start()); }

    void registerInstance() {
        instanceBus = connect();
        instance = std::make_unique<BusServer>(
            instanceBus.get(), kPrompterInterface,
            std::vector<BusServer::Method>{{"NameKeyring", naming},
                                           {"AskKeyringPassword", asking},
                                           {"UnlockKeyring", opening}});
        ASSERT_TRUE(instance->start());
        ASSERT_GE(sd_bus_call_method_async(
                      instanceBus.get(), nullptr, nameOf(daemonBus.get()).c_str(), kObjectPath,
                      kPromptersInterface, "RegisterPrompter", nullptr, nullptr, ""),
                  0);
        runUntil([this] { return registry.prompterOf(user).has_value(); });
    }
    void name() {
        question = keyrings.name(user, [this](Outcome<std::string> given) {
            outcome = given ? *given : given.refusal().text;
            status = given ? 0 : given.refusal().status;
        });
    }
    void ask() {
        question = keyrings.askPassword(
            user, {"Card A", "alice", "/keyring/login"}, [this](const Outcome<Secret>& given) {
                outcome = given ? std::string(given->text()) : given.refusal().text;
                status = given ? 0 : given.refusal().status;
            });
    }
    void unlock() {
        question = keyrings.unlock(user, Secret("open sesame"),
                                   [this](const std::optional<Refusal>& refusal) {
                                       outcome = refusal ? refusal->text : "opened";
                                       status = refusal ? refusal->status : 0;
                                   });
    }
    PatientExchanges::Request& next(PatientExchanges& exchanges) {
        runUntil([&] { return !exchanges.waiting.empty(); });
        return exchanges.waiting.front();
    }
    void runUntilAnswered() {
        runUntil([this] { return outcome.has_value(); });
    }

    const platform::UserId user = geteuid();
    std::int64_t now = 50'000;  // milliseconds

    PatientExchanges naming;
    PatientExchanges asking;
    PatientExchanges opening;
    platform::SdBus instanceBus;
    std::unique_ptr<BusServer> instance;

    platform::SdBus daemonBus = connect();
    BusCallerWatch callers{daemonBus.get()};
    PrompterRegistry registry{daemonBus.get(), callers, [this] { return now; }};
    BusUserKeyrings keyrings{event(), registry, {.machine = 300ms, .person = 600ms}};
    std::optional<std::string> outcome;
    platform::Status status = 0;
    std::unique_ptr<UserKeyrings::Question> question;
};

TEST_F(BusUserKeyringsTest, NamesTheKeyringThroughTheUsersInstance) {
    registerInstance();
    name();

    next(naming).reply(writeKeyringName("/keyring/login"));
    runUntilAnswered();

    EXPECT_EQ(outcome, "/keyring/login");
}

TEST_F(BusUserKeyringsTest, AsksThePersonThroughTheUsersInstance) {
    registerInstance();
    ask();

    auto& asked = next(asking);
    const auto read = readKeyringQuestion(asked.request.message);
    ASSERT_TRUE(read);
    EXPECT_EQ(read->card, "Card A");
    EXPECT_EQ(read->account, "alice");
    EXPECT_EQ(read->keyring, "/keyring/login");
    asked.reply(writeKeyringPassword(Secret("open sesame")));
    runUntilAnswered();

    EXPECT_EQ(outcome, "open sesame");
}

TEST_F(BusUserKeyringsTest, UnlocksThroughTheUsersInstance) {
    registerInstance();
    unlock();

    auto& asked = next(opening);
    EXPECT_EQ(readUnlocking(asked.request.message)->text(), "open sesame");
    asked.reply(numberReply(0));
    runUntilAnswered();

    EXPECT_EQ(outcome, "opened");
}

TEST_F(BusUserKeyringsTest, PassesRefusalsOn) {
    registerInstance();
    ask();

    next(asking).reply(refusalReply({status::kKeyringRefused, "three times."}));
    runUntilAnswered();

    EXPECT_EQ(status, status::kKeyringRefused);
    EXPECT_EQ(outcome, "three times.");
}

TEST_F(BusUserKeyringsTest, SaysThatTheUserIsNotThere) {
    now += 2'000;
    name();
    EXPECT_FALSE(outcome) << "never before the call has returned";
    runUntilAnswered();

    EXPECT_EQ(status, status::kNoKeyring);
    EXPECT_THAT(*outcome, HasSubstr("not logged in on a desktop"));
}

TEST_F(BusUserKeyringsTest, WaitsForTheInstanceWhenTheDaemonHasJustStarted) {
    ask();
    runUntilQuiet();
    EXPECT_FALSE(outcome);

    registerInstance();
    next(asking).reply(writeKeyringPassword(Secret("open sesame")));
    runUntilAnswered();

    EXPECT_EQ(outcome, "open sesame");
}

TEST_F(BusUserKeyringsTest, GivesAPersonMoreTimeThanAMachineAndBothAnEnd) {
    registerInstance();
    name();
    next(naming);
    runUntilAnswered();
    EXPECT_EQ(status, status::kNoKeyring);
    EXPECT_THAT(*outcome, HasSubstr("in time"));

    outcome.reset();
    ask();
    next(asking);
    runUntilAnswered();
    EXPECT_THAT(*outcome, HasSubstr("in time"));
}

TEST_F(BusUserKeyringsTest, SaysThatTheInstanceHasEnded) {
    registerInstance();
    ask();
    next(asking);

    instance.reset();
    instanceBus.reset();
    runUntilAnswered();

    EXPECT_EQ(status, status::kNoKeyring);
}

TEST_F(BusUserKeyringsTest, LeavesTheBusWhenTheQuestionIsGivenUp) {
    registerInstance();
    BusCallerWatch watching(instanceBus.get());
    ask();
    bool isGone = false;
    const auto watch = watching.watch(next(asking).caller.connection, [&isGone] { isGone = true; });

    question.reset();
    runUntil([&isGone] { return isGone; });

    EXPECT_FALSE(outcome);
}

TEST_F(BusUserKeyringsTest, AsksNoPersonWhenTheDaemonIsAboutToEnd) {
    registerInstance();
    keyrings.askNobody();

    ask();
    runUntilAnswered();

    EXPECT_EQ(status, status::kNoKeyring);
    EXPECT_THAT(*outcome, HasSubstr("Try again"));
    EXPECT_TRUE(asking.waiting.empty());
}

}  // namespace
}  // namespace vlm::service
