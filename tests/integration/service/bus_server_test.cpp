// The server on a real bus, with a handler in the test's hands. Server and callers run on one event
// loop.

#include "services/hints/bus_server.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <deque>
#include <memory>

#include "platform/linux/sd_bus_message.h"
#include "platform_test.h"
#include "services/hints/bus_caller_watch.h"
#include "services/hints/reply.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::service {
namespace {

// Keeps every request until the test answers it.
class PatientExchanges final : public Exchanges {
public:
    struct Request {
        Caller caller;
        IncomingRequest request;
        Reply reply;
    };
    std::deque<Request> waiting;

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override {
        waiting.push_back({caller, request, std::move(reply)});
    }
};

struct EventUnref {
    void operator()(sd_event* event) const { sd_event_unref(event); }
};

class BusServerTest : public fakes::PlatformTest {
protected:
    BusServerTest() {
        sd_event* made = nullptr;
        sd_event_new(&made);
        _event.reset(made);
        serverBus = connect();
        server =
            std::make_unique<BusServer>(serverBus.get(), kHintsInterface, "Exchange", exchanges);
        EXPECT_TRUE(server->start());
    }

    platform::SdBus connect() {
        sd_bus* made = nullptr;
        sd_bus_new(&made);
        platform::SdBus connection(made);
        sd_bus_set_address(made, _bus.address().c_str());
        sd_bus_set_bus_client(made, 1);
        EXPECT_GE(sd_bus_start(made), 0);
        const char* name = nullptr;
        EXPECT_GE(sd_bus_get_unique_name(made, &name), 0);
        sd_bus_attach_event(made, _event.get(), 0);
        return connection;
    }

    void send(sd_bus* from, std::uint64_t operation) {
        const char* to = nullptr;
        sd_bus_get_unique_name(serverBus.get(), &to);
        sd_bus_message* made = nullptr;
        sd_bus_message_new_method_call(from, &made, to, kObjectPath, kHintsInterface, "Exchange");
        const platform::SdBusMessage call(made);
        platform::Message request;
        request.set("op", operation);
        std::string reason;
        ASSERT_TRUE(platform::appendDictionary(made, request, reason)) << reason;
        ASSERT_GE(sd_bus_call_async(from, nullptr, made, onReply, this, UINT64_MAX), 0);
    }

    void runUntil(const std::function<bool()>& isSo) {
        while (!isSo()) ASSERT_GT(sd_event_run(_event.get(), 10'000'000), 0) << "nothing happens";
    }
    void runUntilQuiet() {
        while (sd_event_run(_event.get(), 100'000) > 0) {
        }
    }
    void answer(std::size_t which, std::int64_t number) {
        exchanges.waiting.at(which).reply(numberReply(number));
    }

    static int onReply(sd_bus_message* message, void* self, sd_bus_error*) {
        std::string reason;
        const auto read = platform::readDictionary(message, reason);
        static_cast<BusServerTest*>(self)->replies.push_back(
            read ? read->message.integer("res").value_or(-1) : -2);
        return 1;
    }

private:
    test::PrivateBus _bus;
    std::unique_ptr<sd_event, EventUnref> _event;

protected:
    PatientExchanges exchanges;
    platform::SdBus serverBus;
    std::unique_ptr<BusServer> server;
    std::vector<std::int64_t> replies;
};

TEST_F(BusServerTest, TellsWhoCallsFromWhatTheBusSays) {
    const auto caller = connect();

    send(caller.get(), 6);
    runUntil([&] { return !exchanges.waiting.empty(); });

    const auto& seen = exchanges.waiting[0].caller;
    const char* name = nullptr;
    sd_bus_get_unique_name(caller.get(), &name);
    EXPECT_EQ(seen.user, geteuid());
    EXPECT_EQ(seen.process, getpid());
    EXPECT_EQ(seen.connection, name);
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
    const char* name = nullptr;
    sd_bus_get_unique_name(caller.get(), &name);
    const std::string connection = name;
    int left = 0;
    const auto watch = callers.watch(connection, [&] { ++left; });
    ASSERT_TRUE(watch);
    runUntilQuiet();
    EXPECT_EQ(left, 0);

    caller.reset();
    runUntil([&] { return left > 0; });

    EXPECT_EQ(left, 1);
    EXPECT_FALSE(callers.watch(connection, [&] { ++left; }));
}

TEST_F(BusServerTest, LetsAWatchBeDroppedByItsOwnCall) {
    BusCallerWatch callers(serverBus.get());
    auto caller = connect();
    const char* name = nullptr;
    sd_bus_get_unique_name(caller.get(), &name);
    std::unique_ptr<CallerWatch::Watch> watch;
    bool left = false;
    watch = callers.watch(name, [&] {
        watch.reset();
        left = true;
    });

    caller.reset();
    runUntil([&] { return left; });

    EXPECT_FALSE(watch);
}

}  // namespace
}  // namespace vlm::service
