// The server on a real bus, with a handler in the test's hands. Server and callers run on one event
// loop.

#include "services/hints/bus_server.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <memory>

#include "bus_test.h"
#include "services/hints/bus_caller_watch.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

class BusServerTest : public BusTest {
protected:
    BusServerTest() { EXPECT_TRUE(server->start()); }

    void send(sd_bus* from, std::uint64_t operation) {
        BusTest::send(from, nameOf(serverBus.get()), operation);
    }
    void answer(std::size_t which, std::int64_t number) {
        exchanges.waiting.at(which).reply(numberReply(number));
    }

    PatientExchanges exchanges;
    platform::SdBus serverBus = connect();
    std::unique_ptr<BusServer> server = std::make_unique<BusServer>(
        serverBus.get(), kHintsInterface, std::vector<BusServer::Method>{{"Exchange", exchanges}});
};

TEST_F(BusServerTest, TellsWhoCallsFromWhatTheBusSays) {
    const auto caller = connect();

    send(caller.get(), 6);
    runUntil([&] { return !exchanges.waiting.empty(); });

    const auto& seen = exchanges.waiting[0].caller;
    EXPECT_EQ(seen.user, geteuid());
    EXPECT_EQ(seen.process, getpid());
    EXPECT_EQ(seen.connection, nameOf(caller.get()));
    EXPECT_EQ(exchanges.waiting[0].request.message.unsignedInteger("op"), 6u);
}

TEST_F(BusServerTest, AnswersInAnyOrder) {
    const auto caller = connect();
    send(caller.get(), 1);
    send(caller.get(), 2);
    runUntil([&] { return exchanges.waiting.size() == 2; });

    answer(1, 22);
    answer(0, 11);
    runUntil([&] { return replies.size() == 2; });

    EXPECT_THAT(replies, testing::ElementsAre(22, 11));
}

TEST_F(BusServerTest, AnswersARequestOnce) {
    const auto caller = connect();
    send(caller.get(), 1);
    runUntil([&] { return !exchanges.waiting.empty(); });

    answer(0, 1);
    answer(0, 2);
    runUntilQuiet();

    EXPECT_THAT(replies, testing::ElementsAre(1));
}

TEST_F(BusServerTest, ToleratesAnAnswerToACallerThatHasLeft) {
    auto caller = connect();
    send(caller.get(), 1);
    runUntil([&] { return !exchanges.waiting.empty(); });
    caller.reset();
    runUntilQuiet();

    answer(0, 1);

    const auto other = connect();
    send(other.get(), 2);
    runUntil([&] { return exchanges.waiting.size() == 2; });
    answer(1, 2);
    runUntil([&] { return !replies.empty(); });
    EXPECT_THAT(replies, testing::ElementsAre(2));
}

TEST_F(BusServerTest, ToleratesAnAnswerAfterItsOwnEnd) {
    const auto caller = connect();
    send(caller.get(), 1);
    runUntil([&] { return !exchanges.waiting.empty(); });

    server.reset();
    answer(0, 1);
    runUntilQuiet();

    EXPECT_TRUE(replies.empty());
}

TEST_F(BusServerTest, AsksTheBusOnceAboutACaller) {
    const auto caller = connect();
    for (std::uint64_t operation = 1; operation <= 3; ++operation) send(caller.get(), operation);
    runUntil([&] { return exchanges.waiting.size() == 3; });

    for (std::size_t which = 0; which < 3; ++which) {
        EXPECT_EQ(exchanges.waiting[which].caller.process, getpid());
        answer(which, 0);
    }
    send(caller.get(), 4);
    runUntil([&] { return exchanges.waiting.size() == 4; });
    answer(3, 0);
    runUntil([&] { return replies.size() == 4; });

    EXPECT_EQ(numbersOfReplies[3], numbersOfReplies[2] + 1) << "it has sent something in between";
}

TEST_F(BusServerTest, PassesOverWhatWantsNoAnswer) {
    const auto caller = connect();

    sendAndWantNoAnswer(caller.get(), nameOf(serverBus.get()), 1);
    send(caller.get(), 2);
    runUntil([&] { return !exchanges.waiting.empty(); });

    EXPECT_EQ(exchanges.waiting[0].request.message.unsignedInteger("op"), 2u);
}

TEST_F(BusServerTest, BoundsWhatOneUserMayHaveWaiting) {
    const auto caller = connect();
    for (std::size_t sent = 0; sent < BusServer::kMostWaitingOfOneUser + 3; ++sent)
        send(caller.get(), 1);
    runUntil([&] { return replies.size() == 3; });

    EXPECT_THAT(replies, testing::Each(status::kBusy));
    EXPECT_EQ(exchanges.waiting.size(), BusServer::kMostWaitingOfOneUser);

    answer(0, 0);
    send(caller.get(), 1);
    runUntil([&] { return exchanges.waiting.size() > BusServer::kMostWaitingOfOneUser; });
}

TEST_F(BusServerTest, CountsNoRequestWhoseAnswerWasGivenUp) {
    for (int round = 0; round < 3; ++round) {
        const auto caller = connect();
        for (std::size_t sent = 0; sent < BusServer::kMostWaitingOfOneUser; ++sent)
            send(caller.get(), 1);
        runUntil([&] { return exchanges.waiting.size() == BusServer::kMostWaitingOfOneUser; });

        exchanges.waiting.clear();
    }

    EXPECT_TRUE(replies.empty());
}

TEST_F(BusServerTest, NoticesThatACallerLeaves) {
    BusCallerWatch callers(serverBus.get());
    auto caller = connect();
    const auto connection = nameOf(caller.get());
    int left = 0;
    const auto watch = callers.watch(connection, [&] { ++left; });
    ASSERT_TRUE(watch);
    runUntilQuiet();
    EXPECT_EQ(left, 0);

    caller.reset();
    runUntil([&] { return left > 0; });

    EXPECT_EQ(left, 1);
}

TEST_F(BusServerTest, NoticesThatACallerHasLeftAlready) {
    BusCallerWatch callers(serverBus.get());
    const auto connection = nameOf(connect().get());
    int left = 0;

    const auto watch = callers.watch(connection, [&] { ++left; });
    EXPECT_EQ(left, 0);
    runUntil([&] { return left > 0; });
    runUntilQuiet();

    EXPECT_EQ(left, 1);
}

TEST_F(BusServerTest, LetsAWatchBeDroppedByItsOwnCall) {
    BusCallerWatch callers(serverBus.get());
    auto caller = connect();
    std::unique_ptr<CallerWatch::Watch> watch;
    bool left = false;
    watch = callers.watch(nameOf(caller.get()), [&] {
        watch.reset();
        left = true;
    });

    caller.reset();
    runUntil([&] { return left; });

    EXPECT_FALSE(watch);
}

}  // namespace
}  // namespace vlm::service
