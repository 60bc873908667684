#include <gmock/gmock.h>
#include <pthread.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "platform/linux/sd_bus_named_service_ipc.h"
#include "platform/token_framework.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::test {

namespace {

using platform::ConnectionEvent;
using platform::Message;
using platform::ServiceScope;
using ::testing::HasSubstr;

constexpr const char* kService = "org.vlm.test.service";

class SdBusNamedServiceIpcTest : public ::testing::Test {
protected:
    void SetUp() override { useBus({}); }
    void TearDown() override {
        ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
        ::unsetenv("DBUS_SESSION_BUS_ADDRESS");
    }

    void useBus(const PrivateBus::Options& options) {
        bus = std::make_unique<PrivateBus>(options);
        ::setenv("DBUS_SYSTEM_BUS_ADDRESS", bus->address().c_str(), 1);
        ::unsetenv("DBUS_SESSION_BUS_ADDRESS");
    }

    std::unique_ptr<platform::Connection> connect(ServiceScope scope = ServiceScope::Machine) {
        auto connection = _ipc.connect(kService, scope);
        connection->setEventHandler([this](auto event) { events.push_back(event); });
        connection->resume();
        return connection;
    }

    std::unique_ptr<BusService> serve(BusService::Answer answer) {
        return std::make_unique<BusService>(bus->address(), kService, std::move(answer));
    }

    static Message echo(const Message& request) { return request; }

    static std::string errorText(const Message& reply) {
        std::optional<platform::Error> error;
        EXPECT_FALSE(platform::decodeReplyError(reply, &error));
        return error ? error->description() : "";
    }

    std::unique_ptr<PrivateBus> bus;
    std::vector<ConnectionEvent> events;

private:
    platform::SdBusNamedServiceIpc _ipc;
};

TEST_F(SdBusNamedServiceIpcTest, NamesAServiceThatIsNotThereAndTheBusWithoutIt) {
    const auto reply = connect()->sendAndWait({});

    EXPECT_THAT(errorText(reply),
                HasSubstr("The service org.vlm.test.service on the system bus is not there: "));
    EXPECT_THAT(errorText(reply), HasSubstr("Check that it is installed."));
}

TEST_F(SdBusNamedServiceIpcTest, SaysWhenThereIsNoBus) {
    ::setenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nonexistent/bus", 1);
    ::setenv("DBUS_SESSION_BUS_ADDRESS", "unix:path=/nonexistent/bus", 1);

    const auto fromSystem = connect()->sendAndWait({});
    const auto fromSession = connect(ServiceScope::User)->sendAndWait({});

    EXPECT_EQ(errorText(fromSystem),
              "The service org.vlm.test.service on the system bus cannot be reached, since there "
              "is no such bus: No such file or directory. Start the system's message bus.");
    EXPECT_THAT(errorText(fromSession), HasSubstr("session bus cannot be reached"));
    EXPECT_EQ(events, (std::vector{ConnectionEvent::Invalid, ConnectionEvent::Invalid}));
}

TEST_F(SdBusNamedServiceIpcTest, FindsTheUsersOwnServicesOnTheSessionBus) {
    const auto service = serve(echo);
    ::setenv("DBUS_SESSION_BUS_ADDRESS", bus->address().c_str(), 1);
    ::setenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nonexistent/bus", 1);
    Message request;
    request.set("uid", std::int64_t{1});

    EXPECT_EQ(connect(ServiceScope::User)->sendAndWait(request), request);
}

TEST_F(SdBusNamedServiceIpcTest, SaysThatTheServiceEndedBeforeItAnswered) {
    auto dying = std::make_unique<BusService>(bus->address(), kService,
                                              BusService::Handler([](sd_bus_message* call) {
                                                  sd_bus_close(sd_bus_message_get_bus(call));
                                                  return 0;
                                              }));
    const auto connection = connect();

    const auto reply = connection->sendAndWait({});

    EXPECT_THAT(errorText(reply), HasSubstr("ended before it answered"));
    EXPECT_EQ(events, std::vector{ConnectionEvent::Interrupted});

    dying.reset();
    const auto service = serve(echo);
    EXPECT_TRUE(connection->sendAndWait({}).entries().empty()) << "the service is back";
}

TEST_F(SdBusNamedServiceIpcTest, SaysThatTheBusWentAwayAndFindsItAgain) {
    auto service = std::make_unique<BusService>(bus->address(), kService,
                                                BusService::Handler([&](sd_bus_message*) {
                                                    bus->stop();
                                                    return 0;
                                                }));
    const auto connection = connect();

    const auto reply = connection->sendAndWait({});

    EXPECT_THAT(errorText(reply), HasSubstr("org.vlm.test.service on the system bus"));
    EXPECT_EQ(events, std::vector{ConnectionEvent::Interrupted});

    service.reset();
    useBus({});
    service = serve(echo);
    EXPECT_TRUE(connection->sendAndWait({}).entries().empty()) << "the bus is back";
}

TEST_F(SdBusNamedServiceIpcTest, SaysThatTheBusDoesNotAllowTheCall) {
    const TemporaryFolder folder;
    const auto policy = folder.write(
        "own.conf", "<busconfig><policy context='default'><allow own='*'/></policy></busconfig>");
    useBus({.permissive = false, .serviceFolders = {}, .includes = {policy}});
    const auto service = serve(echo);

    const auto reply = connect()->sendAndWait({});

    EXPECT_THAT(errorText(reply), HasSubstr("may not be called by this user"));
    EXPECT_THAT(errorText(reply), HasSubstr("An administrator can allow it"));
    EXPECT_TRUE(events.empty()) << "the service is there all the same";
}

TEST_F(SdBusNamedServiceIpcTest, SaysThatTheServiceCouldNotBeStarted) {
    const TemporaryFolder folder;
    folder.write("org.vlm.test.service.service",
                 "[D-BUS Service]\nName=org.vlm.test.service\nExec=/bin/false\n");
    useBus({.serviceFolders = {folder.path()}, .includes = {}});

    const auto reply = connect()->sendAndWait({});

    EXPECT_THAT(errorText(reply), HasSubstr("could not be started"));
    EXPECT_EQ(events, std::vector{ConnectionEvent::Invalid});
}

TEST_F(SdBusNamedServiceIpcTest, PassesOnWhyAServiceRefusesACall) {
    const BusService service(bus->address(), kService,
                             BusService::Handler([](sd_bus_message* call) {
                                 return sd_bus_reply_method_errorf(call, "org.example.Tired",
                                                                   "not today\n\x1b[31mforged");
                             }));

    const auto reply = connect()->sendAndWait({});

    EXPECT_THAT(errorText(reply),
                HasSubstr("refused the request: not today\\n\\x1b[31mforged (org.example.Tired)."));
    EXPECT_TRUE(events.empty());
}

TEST_F(SdBusNamedServiceIpcTest, SaysThatAnAnswerCannotBeRead) {
    const BusService service(bus->address(), kService,
                             BusService::Handler([](sd_bus_message* call) {
                                 return sd_bus_reply_method_return(call, "s", "hello");
                             }),
                             "s");

    const auto reply = connect()->sendAndWait({});

    EXPECT_THAT(errorText(reply), HasSubstr("gave an answer that cannot be read: it is of type "
                                            "\"s\" instead of \"a{sv}\"."));
}

TEST_F(SdBusNamedServiceIpcTest, LeavesOutWhatIsOfAForeignType) {
    const BusService service(
        bus->address(), kService, BusService::Handler([](sd_bus_message* call) {
            return sd_bus_reply_method_return(call, "a{sv}", 3, "a", "b", 1, "res", "x",
                                              std::int64_t{0}, "l", "as", 1, "text");
        }));

    const auto reply = connect()->sendAndWait({});

    EXPECT_EQ(reply.entries().size(), 1U);
    EXPECT_EQ(reply.integer("res"), 0);
}

TEST_F(SdBusNamedServiceIpcTest, GoesOnAfterARequestThatCannotBeSent) {
    const auto service = serve(echo);
    const auto connection = connect();
    Message request;
    request.set("str1", std::string("a\xFF"));

    const auto refused = connection->sendAndWait(request);
    request.set("str1", std::string("a"));
    const auto accepted = connection->sendAndWait(request);

    EXPECT_THAT(errorText(refused),
                HasSubstr("was not asked, since the request cannot be sent: the value of \"str1\" "
                          "is not UTF-8 text without zeros."));
    EXPECT_EQ(accepted, request);
    EXPECT_TRUE(events.empty());
}

TEST_F(SdBusNamedServiceIpcTest, RefusesANameThatIsNone) {
    platform::SdBusNamedServiceIpc ipc;
    const auto connection = ipc.connect("no name\n", ServiceScope::Machine);
    connection->resume();

    EXPECT_THAT(errorText(connection->sendAndWait({})),
                HasSubstr("The service no name\\n on the system bus was not asked"));
}

// The calling thread waits in the kernel again, for the n-th signal to find it there.
void waitUntilAsleep(long thread) {
    for (std::string state; state != "S";) {
        std::ifstream stat("/proc/self/task/" + std::to_string(thread) + "/stat");
        stat.ignore(1024, ')');
        stat >> state;
        std::this_thread::yield();
    }
}

TEST_F(SdBusNamedServiceIpcTest, AsksOnceAndWaitsOnWhenSignalsArrive) {
    struct sigaction noticed {};
    noticed.sa_handler = [](int) {};
    struct sigaction before {};
    ::sigaction(SIGUSR1, &noticed, &before);
    const pthread_t caller = ::pthread_self();
    const long callerId = ::syscall(SYS_gettid);
    std::int64_t asked = 0;
    const auto service = serve([&](const Message&) {
        for (int count = 0; count < 5; ++count) {
            waitUntilAsleep(callerId);
            ::pthread_kill(caller, SIGUSR1);
        }
        Message reply;
        reply.set("res", ++asked);
        return reply;
    });

    const auto reply = connect()->sendAndWait({});

    EXPECT_EQ(reply.integer("res"), 1);
    EXPECT_TRUE(events.empty());
    ::sigaction(SIGUSR1, &before, nullptr);
}

TEST_F(SdBusNamedServiceIpcTest, LeavesNoDescriptorOpenBehindAConnection) {
    const auto service = serve(echo);
    const auto count = [] {
        const std::filesystem::directory_iterator open("/proc/self/fd");
        return std::distance(begin(open), end(open));
    };
    connect()->sendAndWait({});
    const auto before = count();

    for (int round = 0; round < 3; ++round) connect()->sendAndWait({});

    EXPECT_EQ(count(), before);
}

}  // namespace

}  // namespace vlm::test
