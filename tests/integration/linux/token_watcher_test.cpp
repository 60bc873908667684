// The watcher of tokens, when the service and the bus behind it come and go.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <future>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "platform/linux/bus_token_watcher.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/token_service.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;

class TokenWatcherTest : public testing::Test {
protected:
    TokenWatcherTest() {
        // Without the bus's own identifier, as in a session: a bus that comes back has another.
        const auto address = bus.address().substr(0, bus.address().find(','));
        setenv("DBUS_SESSION_BUS_ADDRESS", address.c_str(), 1);
    }
    ~TokenWatcherTest() override {
        watcher.reset();
        unsetenv("DBUS_SESSION_BUS_ADDRESS");
    }

    void startService(std::set<std::string> tokens) {
        service = std::make_unique<TokenService>(bus.address(), std::move(tokens));
    }
    void watch() {
        watcher = platform::BusTokenFramework().watchTokens();
        watcher->setInsertionHandler([this, &same = *watcher](const std::string& token) {
            note("+" + token);
            same.addRemovalHandler(token, [this](const auto& gone) { note("-" + gone); });
        });
    }
    void note(const std::string& line) {
        const std::lock_guard lock(mutex);
        lines.push_back(line);
    }
    std::vector<std::string> told() {
        const std::lock_guard lock(mutex);
        return lines;
    }
    bool isTold(std::size_t many) {
        return eventually([&] { return told().size() >= many; });
    }

    PrivateBus bus;
    std::unique_ptr<TokenService> service;
    std::mutex mutex;
    std::vector<std::string> lines;
    std::shared_ptr<platform::TokenWatcher> watcher;
};

TEST_F(TokenWatcherTest, TellsTheDifferencesWhenTheServiceIsBack) {
    startService({"a", "b"});
    watch();
    ASSERT_TRUE(isTold(2));

    service.reset();
    startService({"b", "c"});

    ASSERT_TRUE(isTold(4));
    EXPECT_THAT(told(), ElementsAre("+a", "+b", "-a", "+c"));
}

TEST_F(TokenWatcherTest, ForgetsNothingWhileTheServiceIsAway) {
    startService({"a"});
    watch();
    ASSERT_TRUE(isTold(1));

    service.reset();

    EXPECT_THAT(watcher->tokenIds(), ElementsAre("a"));
    EXPECT_THAT(told(), ElementsAre("+a"));
}

TEST_F(TokenWatcherTest, FindsAServiceThatComesLater) {
    watch();

    startService({"a"});

    EXPECT_TRUE(isTold(1));
}

TEST_F(TokenWatcherTest, AsksAgainAServiceThatRefused) {
    startService({"a"});
    service->refuseOnce();

    watch();

    EXPECT_TRUE(isTold(1));
    EXPECT_TRUE(service->isAsked(2));
}

TEST_F(TokenWatcherTest, FindsABusThatComesBack) {
    startService({"a"});
    watch();
    ASSERT_TRUE(isTold(1));

    service.reset();
    bus.restart();
    startService({"b"});

    ASSERT_TRUE(isTold(3));
    EXPECT_THAT(told(), ElementsAre("+a", "-a", "+b"));
}

TEST_F(TokenWatcherTest, EndsAtOnceWhileTheServiceDoesNotAnswer) {
    startService({"a"});
    service->hold();
    watch();
    ASSERT_TRUE(service->isAsked());

    watcher.reset();

    EXPECT_TRUE(told().empty());
}

TEST_F(TokenWatcherTest, EndsAtOnceWithoutABus) {
    bus.stop();
    watch();

    watcher.reset();

    EXPECT_TRUE(told().empty());
}

TEST_F(TokenWatcherTest, IsNotWokenWhileAllIsQuiet) {
    startService({"a"});
    watch();
    ASSERT_TRUE(isTold(1));
    std::promise<pid_t> thread;
    watcher->addRemovalHandler("(not there)", [&](const auto&) { thread.set_value(gettid()); });
    const auto path = "/proc/self/task/" + std::to_string(thread.get_future().get()) + "/status";
    const auto timesAsleep = [&path] {
        std::ifstream status(path);
        std::string line;
        while (std::getline(status, line) && !line.starts_with("voluntary_ctxt_switches")) {
        }
        return line;
    };
    // Until it sleeps after the handler.
    // It goes to sleep once more after that handler, which nothing tells.
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    const auto before = timesAsleep();

    // What a quiet program does is nothing, so there is no event to wait for.
    std::this_thread::sleep_for(std::chrono::seconds(2));

    EXPECT_EQ(timesAsleep(), before);
}

}  // namespace
}  // namespace vlm::test
