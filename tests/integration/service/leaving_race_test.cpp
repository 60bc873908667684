// No request is lost between the daemon's leaving and its next start.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <functional>
#include <memory>
#include <random>
#include <string_view>
#include <vector>

#include "hints_machine.h"
#include "platform/linux/sd_bus_handles.h"

namespace vlm::test {
namespace {

using namespace std::chrono_literals;

struct EventUnref {
    void operator()(sd_event* event) const { sd_event_unref(event); }
};
using Event = std::unique_ptr<sd_event, EventUnref>;

Event newEvent() {
    sd_event* made = nullptr;
    sd_event_new(&made);
    return Event(made);
}

platform::SdBus connect(const PrivateBus& bus, sd_event* event) {
    sd_bus* made = nullptr;
    sd_bus_new(&made);
    platform::SdBus connection(made);
    sd_bus_set_address(made, bus.address().c_str());
    sd_bus_set_bus_client(made, 1);
    EXPECT_GE(sd_bus_start(made), 0);
    sd_bus_attach_event(made, event, 0);
    return connection;
}

// A program that asks the daemon, by turns, for the cards and whether root is paired.
class Asker {
public:
    Asker(const PrivateBus& bus, sd_event* event) : _event(event), _bus(connect(bus, event)) {}

    void ask() {
        const bool forCards = _asked++ % 2 == 0;
        const int sent =
            forCards ? call("a{sv}", 2, "op", "t", std::uint64_t{1}, "uid", "x", std::int64_t{-1})
                     : call("a{sv}", 2, "op", "t", std::uint64_t{6}, "str1", "s", "root");
        EXPECT_GE(sent, 0);
    }
    void askAfter(std::chrono::microseconds pause) {
        sd_event_add_time_relative(_event, nullptr, CLOCK_MONOTONIC,
                                   static_cast<std::uint64_t>(pause.count()), 1, onTime, this);
    }
    // Until the bus has passed on what was asked: it takes a sender's messages in their order.
    void waitUntilDelivered() {
        EXPECT_GE(sd_bus_call_method(_bus.get(), "org.freedesktop.DBus", "/org/freedesktop/DBus",
                                     "org.freedesktop.DBus", "GetId", nullptr, nullptr, nullptr),
                  0);
    }

    bool isAnswered() const { return answers == _asked; }

    std::size_t answers = 0;
    std::vector<std::string> problems;

private:
    template <typename... Arguments>
    int call(Arguments... arguments) {
        return sd_bus_call_method_async(_bus.get(), nullptr, kDaemon, "/org/vlm/token/hints",
                                        "org.vlm.token.hints", "Exchange", onReply, this,
                                        arguments...);
    }
    static int onTime(sd_event_source*, std::uint64_t, void* self) {
        static_cast<Asker*>(self)->ask();
        return 0;
    }
    static int onReply(sd_bus_message* reply, void* self, sd_bus_error*) {
        auto& asker = *static_cast<Asker*>(self);
        ++asker.answers;
        if (const auto* error = sd_bus_message_get_error(reply))
            asker.problems.push_back(error->message ? error->message : error->name);
        else if (!isGood(reply))
            asker.problems.emplace_back("refused");
        return 0;
    }
    // A good answer is "res" alone; a refusal tells its error too.
    static bool isGood(sd_bus_message* reply) {
        const char* key = nullptr;
        return sd_bus_message_enter_container(reply, 'a', "{sv}") > 0 &&
               sd_bus_message_enter_container(reply, 'e', "sv") > 0 &&
               sd_bus_message_read(reply, "s", &key) > 0 && std::string_view(key) == "res" &&
               sd_bus_message_skip(reply, "v") > 0 && sd_bus_message_exit_container(reply) > 0 &&
               sd_bus_message_at_end(reply, 0) > 0;
    }

    sd_event* _event;
    platform::SdBus _bus;
    std::size_t _asked = 0;
};

// Counts how often a daemon has given its name back.
class LeavingCounter {
public:
    LeavingCounter(const PrivateBus& bus, sd_event* event) : _bus(connect(bus, event)) {
        const auto rule = std::string(
                              "type='signal',sender='org.freedesktop.DBus',"
                              "member='NameOwnerChanged',arg0='") +
                          kDaemon + "'";
        EXPECT_GE(sd_bus_add_match(_bus.get(), nullptr, rule.c_str(), onChange, this), 0);
    }
    LeavingCounter(const LeavingCounter&) = delete;
    LeavingCounter& operator=(const LeavingCounter&) = delete;

    int count = 0;

private:
    static int onChange(sd_bus_message* signal, void* self, sd_bus_error*) {
        const char* name = nullptr;
        const char* before = nullptr;
        const char* now = nullptr;
        if (sd_bus_message_read(signal, "sss", &name, &before, &now) > 0 &&
            std::string_view(now).empty())
            ++static_cast<LeavingCounter*>(self)->count;
        return 0;
    }

    platform::SdBus _bus;
};

// Where the daemon tells systemd what it does, with no room left until the test makes it.
class FullNotifySocket {
public:
    explicit FullNotifySocket(const std::string& path) {
        sockaddr_un address{AF_UNIX, {}};
        path.copy(address.sun_path, sizeof address.sun_path - 1);
        const auto* at = reinterpret_cast<const sockaddr*>(&address);
        EXPECT_EQ(bind(_socket, at, sizeof address), 0);
        while (sendto(_sender, "full", 4, MSG_DONTWAIT, at, sizeof address) == 4) {
        }
        const timeval patience{20, 0};
        setsockopt(_socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    }
    ~FullNotifySocket() {
        close(_socket);
        close(_sender);
    }
    FullNotifySocket(const FullNotifySocket&) = delete;
    FullNotifySocket& operator=(const FullNotifySocket&) = delete;

    // What the daemon says first.
    std::string receive() const {
        std::array<char, 256> text{};
        ssize_t size = 0;
        do size = recv(_socket, text.data(), text.size(), 0);
        while (size > 0 && std::string_view(text.data(), 4) == "full");
        return {text.data(), static_cast<std::size_t>(std::max<ssize_t>(size, 0))};
    }

private:
    int _socket = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    int _sender = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
};

class LeavingRaceTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0)
            GTEST_SKIP() << "only root may have the name on a bus with the installed policy";
    }
    void runUntil(const std::function<bool()>& isSo) {
        while (!isSo())
            ASSERT_GT(sd_event_run(event.get(), 20'000'000), 0) << "nothing happens any more";
    }

    HintsMachine machine;
    const Event event = newEvent();
};

// The daemon stands still between its decision to leave and the return of its name.
TEST_F(LeavingRaceTest, AnswersWhatComesWhileTheDaemonHasItsNameStill) {
    machine.insertCard();
    const auto path = (machine.folder().path() / "notify").string();
    const FullNotifySocket systemd(path);
    auto options = machine.options();
    options.environment["NOTIFY_SOCKET"] = path;
    Child daemon(machine.daemonCommand({"--idle-seconds", "0.1"}), options);
    ASSERT_TRUE(daemon.waitForErrors("leaving after a quiet time"));
    ASSERT_TRUE(machine.systemBus().hasOwner(kDaemon)) << "systemd is told before the bus";
    Asker first(machine.systemBus(), event.get());
    Asker second(machine.systemBus(), event.get());
    for (int round = 0; round < 4; ++round) {
        first.ask();
        second.ask();
    }
    first.waitUntilDelivered();
    second.waitUntilDelivered();

    EXPECT_EQ(systemd.receive(), "STOPPING=1");
    runUntil([&] { return first.isAnswered() && second.isAnswered(); });

    EXPECT_THAT(first.problems, testing::IsEmpty());
    EXPECT_THAT(second.problems, testing::IsEmpty());
    EXPECT_EQ(daemon.wait(), 0) << daemon.errors();
}

// Everybody asks again at about the time when the daemon leaves.
TEST_F(LeavingRaceTest, AnswersEverybodyWhoAsksAgainAndAgain) {
    constexpr int kLeavings = 40;
    machine.insertCard();
    machine.makeDaemonStartable({"--idle-seconds", "0.02"});
    LeavingCounter leavings(machine.systemBus(), event.get());
    std::vector<std::unique_ptr<Asker>> askers;
    for (int asker = 0; asker < 6; ++asker)
        askers.push_back(std::make_unique<Asker>(machine.systemBus(), event.get()));
    std::mt19937 random(20);  // any seed will do
    // Timers may be late by half of this idle time.
    std::uniform_int_distribution<std::int64_t> aboutIdle(20'000, 31'000);
    std::uniform_int_distribution<std::int64_t> apart(0, 1'500);

    while (leavings.count < kLeavings && !HasFatalFailure()) {
        const auto pause = aboutIdle(random);
        std::size_t answers = 0;
        for (const auto& asker : askers) {
            answers += asker->answers + 1;
            asker->askAfter(std::chrono::microseconds(pause + apart(random)));
        }
        runUntil([&] {
            std::size_t now = 0;
            for (const auto& asker : askers) now += asker->answers;
            return now == answers;
        });
    }

    for (const auto& asker : askers) EXPECT_THAT(asker->problems, testing::IsEmpty());
}

}  // namespace
}  // namespace vlm::test
