// Programs of a user's session that watch tokens, the user's instance, the daemon, and software
// cards.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <mutex>

#include "hints_machine.h"
#include "platform/linux/bus_token_watcher.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class TokenWatchesTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0) GTEST_SKIP() << "only root can start a daemon";
        setenv("DBUS_SESSION_BUS_ADDRESS", machine.sessionBus().address().c_str(), 1);
    }
    void TearDown() override {
        watcher.reset();
        unsetenv("DBUS_SESSION_BUS_ADDRESS");
    }

    void watch() {
        watcher = platform::BusTokenFramework().watchTokens();
        watcher->setInsertionHandler([this, &same = *watcher](const std::string& token) {
            note("+");
            same.addRemovalHandler(token, [this](const std::string&) { note("-"); });
        });
    }
    void note(const std::string& sign) {
        const std::lock_guard lock(mutex);
        signs += sign;
    }
    bool isTold(const std::string& expected) {
        return eventually([&] {
            const std::lock_guard lock(mutex);
            return signs == expected;
        });
    }

    HintsMachine machine;
    std::mutex mutex;
    std::string signs;
    std::shared_ptr<platform::TokenWatcher> watcher;
};

TEST_F(TokenWatchesTest, TellsOfASoftwareCardThatComesAndGoes) {
    machine.startDaemon();
    machine.startAgent(std::nullopt);
    watch();

    machine.cards().add("New", {identity("p256", "Alice Example")});
    ASSERT_TRUE(isTold("+"));
    EXPECT_THAT(watcher->tokenIds(), ElementsAre(HasSubstr("token=New")));
    machine.cards().remove("New");

    EXPECT_TRUE(isTold("+-"));
}

TEST_F(TokenWatchesTest, TellsTheDifferenceAfterARestartOfTheUsersInstance) {
    machine.startDaemon();
    machine.insertCard();
    machine.startAgent(std::nullopt);
    watch();
    ASSERT_TRUE(isTold("+"));

    machine.agent().signal(SIGTERM);
    ASSERT_EQ(machine.agent().wait(), 0);
    machine.removeCard();
    machine.startAgent(std::nullopt);

    EXPECT_TRUE(isTold("+-"));
}

TEST_F(TokenWatchesTest, KeepsWhatItKnowsWhileTheDaemonIsAway) {
    machine.startDaemon();
    machine.insertCard();
    machine.startAgent(std::nullopt);
    watch();
    ASSERT_TRUE(isTold("+"));

    machine.stopDaemon();
    ASSERT_TRUE(machine.agent().waitForErrors("the inserted cards are not known"));
    EXPECT_TRUE(isTold("+"));
    machine.removeCard();
    machine.startDaemon();

    EXPECT_TRUE(isTold("+-"));
}

TEST_F(TokenWatchesTest, LooksAtNothingWhenTheLastWatcherHasLeft) {
    machine.makeDaemonStartable({"--idle-seconds", "3"});
    machine.insertCard();
    machine.startAgent(std::nullopt);
    watch();
    ASSERT_TRUE(isTold("+"));
    const auto daemon = machine.daemonConnection();
    machine.removeCard();
    ASSERT_TRUE(isTold("+-"));
    EXPECT_EQ(machine.daemonConnection(), daemon) << "the looks now and then keep it";

    watcher.reset();

    EXPECT_TRUE(eventually([&] { return machine.daemonConnection().empty(); }));
}

TEST_F(TokenWatchesTest, TellsNoOtherUser) {
    machine.startDaemon();
    machine.startAgent(kNobodyUser);
    const auto watchAs = [&](uid_t user) {
        return run({"busctl", "--address=" + machine.sessionBus().address(), "call", kAgent,
                    "/org/vlm/token/hints", "org.vlm.token.hints.Tokens", "Watch"},
                   machine.options(user));
    };

    EXPECT_EQ(watchAs(kNobodyUser).output, "as 0\n");
    EXPECT_EQ(watchAs(0).output, "as 0\n");
    EXPECT_THAT(watchAs(kOtherUser).errors, HasSubstr("Access denied"));
}

}  // namespace
}  // namespace vlm::test
