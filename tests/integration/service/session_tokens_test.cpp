// What the user's instance does about tokens, with a daemon and a console in the test's hands, on a
// real bus. Its looks without a card event are one at the start and one a second later.

#include "services/hints/session_tokens.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <optional>

#include "bus_test.h"
#include "fake_daemon_link.h"
#include "platform/linux/session_bus_notifications.h"
#include "services/hints/bus_caller_watch.h"
#include "services/hints/reply.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class SessionTokensTest : public BusTest {
protected:
    SessionTokensTest() {
        // This machine's own readers are no part of the test.
        setenv("PCSCLITE_CSOCK_NAME", (folder.path() / "pcscd.comm").c_str(), 1);
        sd_bus_add_filter(receiver.get(), nullptr, onMessage, this);
        EXPECT_GE(sd_bus_request_name(receiver.get(), platform::kNotificationsService, 0), 0);
    }
    ~SessionTokensTest() override { unsetenv("PCSCLITE_CSOCK_NAME"); }

    void beginSession() {
        tokens.emplace(SessionTokens::Parts{event(), connection.get(), callers, daemon,
                                            [](const std::string&) {}});
        EXPECT_TRUE(tokens->start());
    }

    // The daemon answers the look that is under way, or the next one.
    void answerLook(const std::vector<std::string>& tokensInside) {
        platform::PropertyList::Dictionary names;
        for (const auto& token : tokensInside) names.set(token, "Card");
        auto reply = *tokenInfoReply(platform::PropertyList::Dictionary{{"ftn", std::move(names)}});
        reply.set("num1", std::int64_t{0});
        runUntil([&] { return daemon.open() > 0; });
        daemon.answer(std::move(reply));
    }

    void watch(sd_bus* caller) {
        ASSERT_GE(sd_bus_call_method_async(
                      caller, nullptr, nameOf(connection.get()).c_str(), kObjectPath,
                      kTokensInterface, "Watch",
                      [](sd_bus_message*, void* self, sd_bus_error*) {
                          ++static_cast<SessionTokensTest*>(self)->watchesAnswered;
                          return 1;
                      },
                      this, ""),
                  0);
    }

    static int onMessage(sd_bus_message* message, void* self, sd_bus_error*) {
        const char* name = nullptr;
        if (sd_bus_message_is_method_call(message, platform::kNotificationsInterface,
                                          platform::kDeliverMethod) == 0)
            return 0;
        EXPECT_STREQ(sd_bus_message_get_path(message), platform::kNotificationsObject);
        EXPECT_GE(sd_bus_message_read(message, "s", &name), 0);
        auto& test = *static_cast<SessionTokensTest*>(self);
        test.delivered.emplace_back(name ? name : "");
        if (test.isAgentLeaving && test.delivered.size() == 1)
            sd_bus_reply_method_errorf(message, platform::kLeavingError, "post again");
        else
            sd_bus_reply_method_return(message, "");
        return 1;
    }

    test::TemporaryFolder folder;
    platform::SdBus receiver = connect();
    platform::SdBus connection = connect();
    BusCallerWatch callers{connection.get()};
    fakes::FakeDaemonLink daemon;
    std::optional<SessionTokens> tokens;
    std::vector<std::string> delivered;
    bool isAgentLeaving = false;  // when the first notification comes
    int watchesAnswered = 0;
};

TEST_F(SessionTokensTest, NotifiesTheAgentOnceForEachToken) {
    sessions().login(getuid(), /*onConsole=*/true);
    beginSession();

    answerLook({"a"});
    answerLook({"a", "b"});
    runUntil([&] { return delivered.size() >= 2; });
    runUntilQuiet();

    EXPECT_THAT(delivered, ElementsAre("org.vlm.token.new-token", "org.vlm.token.new-token"));
}

TEST_F(SessionTokensTest, NotifiesTheNextAgentWhenOneIsAboutToEnd) {
    sessions().login(getuid(), /*onConsole=*/true);
    isAgentLeaving = true;
    beginSession();

    answerLook({"a"});
    runUntil([&] { return delivered.size() >= 2; });
    runUntilQuiet();

    EXPECT_EQ(delivered.size(), 2U);
}

TEST_F(SessionTokensTest, NotifiesNobodyWhileTheUserIsNotAtTheConsole) {
    sessions().login(getuid(), /*onConsole=*/false);
    sessions().login(getuid() + 1, /*onConsole=*/true);
    beginSession();

    answerLook({"a"});
    runUntilQuiet();
    EXPECT_THAT(delivered, IsEmpty());

    sessions().login(getuid(), /*onConsole=*/true);
    answerLook({"a"});
    runUntil([&] { return !delivered.empty(); });
}

TEST_F(SessionTokensTest, NotifiesTheAgentWhereNoSessionsAreKnown) {
    sessions().stopSessionManager();
    beginSession();

    answerLook({"a"});

    runUntil([&] { return !delivered.empty(); });
}

TEST_F(SessionTokensTest, NotifiesTheAgentNoSecondTimeWhenAProgramWatches) {
    sessions().login(getuid(), /*onConsole=*/true);
    beginSession();
    answerLook({"a"});
    answerLook({"a"});
    runUntil([&] { return !delivered.empty(); });
    const auto watcher = connect();

    watch(watcher.get());
    answerLook({"a"});
    runUntil([&] { return watchesAnswered == 1; });
    runUntilQuiet();

    EXPECT_THAT(delivered, ElementsAre("org.vlm.token.new-token"));
}

}  // namespace
}  // namespace vlm::service
