// A name on a real bus, and what comes for it while it is given back.

#include "services/hints/bus_connection.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "bus_test.h"
#include "services/hints/bus_server.h"
#include "services/hints/reply.h"

namespace vlm::service {
namespace {

class BusConnectionTest : public BusTest {
protected:
    void SetUp() override {
        auto opened = BusConnection::open(event(), BusKind::System,
                                          [this](const std::string& why) { lost = why; });
        ASSERT_TRUE(opened) << opened.refusal().text;
        connection = std::move(*opened);
        server =
            std::make_unique<BusServer>(connection->get(), kHintsInterface,
                                        std::vector<BusServer::Method>{{"Exchange", exchanges}});
        ASSERT_TRUE(server->start());
        ASSERT_EQ(connection->claim(kDaemonName), "");
    }

    // Sends a request and waits until the bus has passed it on: it takes a sender's messages in
    // their order.
    void deliver(sd_bus* from) {
        send(from, kDaemonName, 1);
        ASSERT_GE(sd_bus_call_method(from, "org.freedesktop.DBus", "/org/freedesktop/DBus",
                                     "org.freedesktop.DBus", "GetId", nullptr, nullptr, nullptr),
                  0);
    }

    PatientExchanges exchanges;
    std::unique_ptr<BusConnection> connection;
    std::unique_ptr<BusServer> server;
    std::string lost;
};

TEST_F(BusConnectionTest, HandsOutWhatCameForTheNameBeforeItIsReleased) {
    const auto caller = connect();
    deliver(caller.get());
    deliver(caller.get());
    std::optional<std::size_t> handedOut;

    connection->release([&] { handedOut = exchanges.waiting.size(); });
    runUntil([&] { return handedOut.has_value(); });

    EXPECT_EQ(handedOut, 2u);
    for (const auto& each : exchanges.waiting) each.reply(numberReply(7));
    runUntil([&] { return replies.size() == 2; });
    EXPECT_THAT(replies, testing::Each(7));
}

TEST_F(BusConnectionTest, LeavesTheNameToOthersWithoutTakingThatForALoss) {
    bool isReleased = false;

    connection->release([&] { isReleased = true; });
    runUntil([&] { return isReleased; });

    EXPECT_FALSE(bus.hasOwner(kDaemonName));
    runUntilQuiet();
    EXPECT_EQ(lost, "");
}

TEST_F(BusConnectionTest, TellsThatTheBusWentAwayWhileTheNameIsGivenBack) {
    bool isReleased = false;
    bus.stop();

    connection->release([&] { isReleased = true; });
    runUntil([&] { return !lost.empty(); });

    EXPECT_FALSE(isReleased);
}

}  // namespace
}  // namespace vlm::service
