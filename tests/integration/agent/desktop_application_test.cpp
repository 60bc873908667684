// The agent's process on a real session bus.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <memory>

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/session_bus_notifications.h"
#include "tests/integration/linux/child.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::test {

namespace {

using ::testing::HasSubstr;

class DesktopApplication : public ::testing::Test {
protected:
    std::unique_ptr<Child> start() {
        auto agent = std::make_unique<Child>(std::vector<std::string>{APPLICATION_PROBE},
                                             Child::Options{variables, std::nullopt});
        EXPECT_TRUE(eventually([&] { return bus->hasOwner("org.vlm.vlmbind"); }))
            << agent->errors();
        return agent;
    }

    platform::SdBus connect() const {
        sd_bus* made = nullptr;
        sd_bus_new(&made);
        platform::SdBus connection(made);
        sd_bus_set_address(made, bus->address().c_str());
        sd_bus_set_bus_client(made, 1);
        EXPECT_GE(sd_bus_start(made), 0);
        return connection;
    }

    // The name of the error that was answered; empty for none.
    std::string post(const std::string& word) {
        platform::SdBusError error;
        sd_bus_call_method(poster.get(), platform::kNotificationsService,
                           platform::kNotificationsObject, platform::kNotificationsInterface,
                           platform::kDeliverMethod, error.get(), nullptr, "s", word.c_str());
        return error.name();
    }
    void postWithoutWaiting(const std::string& word) {
        sd_bus_call_method_async(poster.get(), nullptr, platform::kNotificationsService,
                                 platform::kNotificationsObject, platform::kNotificationsInterface,
                                 platform::kDeliverMethod, onAnswer, &answers, "s", word.c_str());
    }
    static int onAnswer(sd_bus_message* answer, void* answers, sd_bus_error*) {
        const auto* error = sd_bus_message_get_error(answer);
        static_cast<std::vector<std::string>*>(answers)->push_back(error ? error->name : "");
        return 0;
    }

    static PrivateBus::Options sessionBus() {
        PrivateBus::Options options;
        options.type = "session";
        return options;
    }

    std::unique_ptr<PrivateBus> bus = std::make_unique<PrivateBus>(sessionBus());
    Child::Environment variables{{"DBUS_SESSION_BUS_ADDRESS", bus->address()},
                                 {"VLM_LOG_TARGET", "stderr"},
                                 {"VLM_LOG_LEVEL", std::nullopt}};
    platform::SdBus poster = connect();
    std::vector<std::string> answers;
};

TEST_F(DesktopApplication, IsToldEachNotificationInTurn) {
    const auto agent = start();

    EXPECT_EQ(post("first"), "");
    EXPECT_EQ(post("second"), "");

    EXPECT_TRUE(agent->waitForOutput("first\nsecond\n"));
}

TEST_F(DesktopApplication, EndsWithTheStatusThatItIsGiven) {
    const auto agent = start();

    post("exit 7");

    EXPECT_EQ(agent->wait(), 7);
    EXPECT_EQ(agent->output(), "exit 7\n");
    EXPECT_EQ(agent->errors(), "");
}

TEST_F(DesktopApplication, DoesTheWorkOfItsMainQueue) {
    const auto agent = start();

    post("work");

    EXPECT_TRUE(agent->waitForOutput("worked\n"));
}

TEST_F(DesktopApplication, TellsWhoPostsWhileItEndsToPostAgain) {
    const auto agent = start();
    postWithoutWaiting("read");
    postWithoutWaiting("exit 0");
    postWithoutWaiting("late");
    // The bus has them when it answers this; the agent stands still in the first.
    sd_bus_flush(poster.get());
    EXPECT_TRUE(bus->hasOwner("org.vlm.vlmbind"));

    agent->write("\n");

    EXPECT_EQ(agent->wait(), 0);
    while (sd_bus_process(poster.get(), nullptr) > 0) {
    }
    EXPECT_EQ(answers, (std::vector<std::string>{"", "", platform::kLeavingError}));
    EXPECT_EQ(agent->output(), "read\nexit 0\n");
}

TEST_F(DesktopApplication, EndsWhenItIsAskedTo) {
    const auto agent = start();

    agent->signal(SIGTERM);

    EXPECT_EQ(agent->wait(), 0);
}

TEST_F(DesktopApplication, EndsOnlyAfterItsTransactionWhenItIsAskedTo) {
    const auto agent = start();
    post("open");

    agent->signal(SIGTERM);

    EXPECT_EQ(post("still there"), "");
    EXPECT_EQ(post("close"), "");
    EXPECT_EQ(agent->wait(), 0);
    EXPECT_EQ(agent->output(), "open\nstill there\nclose\n");
}

TEST_F(DesktopApplication, StaysAfterATransactionThatNobodyInterrupted) {
    const auto agent = start();
    post("open");
    post("close");

    EXPECT_EQ(post("still there"), "");
}

TEST_F(DesktopApplication, EndsWithItsSession) {
    const auto agent = start();

    bus->stop();

    EXPECT_NE(agent->wait(), std::nullopt);
}

TEST_F(DesktopApplication, RunsOnceInASession) {
    const auto agent = start();

    const auto second = run({APPLICATION_PROBE}, {variables, std::nullopt});

    EXPECT_EQ(second.status, 255);
    EXPECT_THAT(second.errors, HasSubstr("The agent cannot receive notifications: it runs"));
    EXPECT_EQ(post("still there"), "");
}

TEST_F(DesktopApplication, NeedsASession) {
    variables["DBUS_SESSION_BUS_ADDRESS"] = std::nullopt;
    variables["XDG_RUNTIME_DIR"] = std::nullopt;

    const auto ended = run({APPLICATION_PROBE}, {variables, std::nullopt});

    EXPECT_EQ(ended.status, 255);
    EXPECT_THAT(ended.errors, HasSubstr("there is no session bus"));
}

}  // namespace

}  // namespace vlm::test
