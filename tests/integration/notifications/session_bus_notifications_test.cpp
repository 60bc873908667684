// Posting on a real session bus, to a receiver that is there, one that the bus starts, and none.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <iterator>
#include <memory>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;

using Clock = std::chrono::steady_clock;
using std::chrono::seconds;

class SessionBusNotifications : public ::testing::Test {
protected:
    // A session bus; with a command line, it starts that for the receiver's name.
    void startBus(const std::string& receiver = "") {
        PrivateBus::Options options;
        options.type = "session";
        std::filesystem::create_directories(folder.path() / "services");
        options.serviceFolders = {folder.path() / "services"};
        if (!receiver.empty())
            folder.write("services/receiver.service",
                         "[D-BUS Service]\nName=org.vlm.vlmbind\nExec=" + receiver + "\n");
        bus = std::make_unique<PrivateBus>(options);
        variables["DBUS_SESSION_BUS_ADDRESS"] = bus->address();
    }

    std::filesystem::path file() const { return folder.path() / "received"; }
    std::string command(const std::string& manner = "") const {
        return NOTIFICATION_RECEIVER " " + file().string() + " " + manner;
    }

    std::unique_ptr<Child> startReceiver(const std::string& manner = "") const {
        auto receiver =
            std::make_unique<Child>(std::vector<std::string>{NOTIFICATION_RECEIVER, file(), manner},
                                    Child::Options{variables, std::nullopt});
        EXPECT_TRUE(receiver->waitForOutput("ready\n")) << receiver->errors();
        return receiver;
    }

    // What the receiver has written once it is this much, or in the end.
    std::string receivedOnceItIs(const std::string& text) const {
        std::string received;
        for (int tries = 0; tries < 500 && received != text; ++tries) {
            if (tries > 0) usleep(10'000);
            std::ifstream stream(file());
            received.assign(std::istreambuf_iterator<char>(stream), {});
        }
        return received;
    }

    Ended post(const std::vector<std::string>& arguments = {"org.vlm.test"}) {
        std::vector<std::string> line{NOTIFICATION_POSTER};
        line.insert(line.end(), arguments.begin(), arguments.end());
        const auto start = Clock::now();
        auto ended = run(line, {variables, std::nullopt});
        took = Clock::now() - start;
        EXPECT_EQ(ended.status, 0) << "whatever becomes of the notification";
        return ended;
    }

    // One line that says what was not delivered, and why.
    void expectOneLine(const Ended& ended, const std::string& why) {
        EXPECT_THAT(ended.errors,
                    StartsWith("error vlmbind: The notification org.vlm.test was not delivered. "
                               "The service org.vlm.vlmbind on the session bus " +
                               why));
        EXPECT_EQ(std::count(ended.errors.begin(), ended.errors.end(), '\n'), 1) << ended.errors;
    }

    TemporaryFolder folder;
    std::map<std::string, std::optional<std::string>> variables{
        {"DBUS_SESSION_BUS_ADDRESS", std::nullopt},
        {"XDG_RUNTIME_DIR", std::nullopt},
        {"VLM_LOG_TARGET", "stderr"},
        {"VLM_LOG_LEVEL", std::nullopt}};
    std::unique_ptr<PrivateBus> bus;
    Clock::duration took{};
};

TEST_F(SessionBusNotifications, ReachAReceiverThatIsThere) {
    startBus();
    const auto receiver = startReceiver();

    EXPECT_EQ(post().errors, "");

    EXPECT_TRUE(receiver->waitForOutput("org.vlm.test\n"));
}

TEST_F(SessionBusNotifications, ComeInTheOrderInWhichTheyArePosted) {
    startBus();
    const auto receiver = startReceiver();

    for (const char* name : {"a.b", "c.d", "a.b"}) post({name});

    EXPECT_EQ(receivedOnceItIs("ready\na.b\nc.d\na.b\n"), "ready\na.b\nc.d\na.b\n");
}

TEST_F(SessionBusNotifications, StartAReceiverThatIsNotThereAndReachIt) {
    startBus(command());

    EXPECT_EQ(post().errors, "");

    EXPECT_EQ(receivedOnceItIs("ready\norg.vlm.test\n"), "ready\norg.vlm.test\n");
}

TEST_F(SessionBusNotifications, StartOneReceiverHoweverManyArePosted) {
    startBus(command());

    for (const char* name : {"a.b", "c.d"}) EXPECT_EQ(post({name}).errors, "");

    EXPECT_EQ(receivedOnceItIs("ready\na.b\nc.d\n"), "ready\na.b\nc.d\n");
}

TEST_F(SessionBusNotifications, DoNotWaitForWhatTheReceiverDoes) {
    startBus();
    const auto receiver = startReceiver("deaf");

    EXPECT_EQ(post().errors, "");

    EXPECT_LT(took, seconds(5)) << "it would have been longer than the longest wait";
}

TEST_F(SessionBusNotifications, DoNotWaitForWhatAStartedReceiverDoes) {
    startBus(command("deaf"));

    EXPECT_EQ(post().errors, "");

    EXPECT_LT(took, seconds(5));
}

TEST_F(SessionBusNotifications, WaitForAReceiverThatNeverComesOnlySoLong) {
    startBus(command("absent"));

    const auto ended = post({"org.vlm.test", "300"});

    expectOneLine(ended, "did not start in time");
    EXPECT_LT(took, seconds(5));
}

TEST_F(SessionBusNotifications, SayThatThereIsNoReceiver) {
    startBus();

    expectOneLine(post(), "is not there");
}

TEST_F(SessionBusNotifications, SayThatTheReceiverCannotBeStarted) {
    startBus("/bin/false");
    expectOneLine(post(), "could not be started");
}

TEST_F(SessionBusNotifications, SayThatTheProgramOfTheReceiverIsNotThere) {
    startBus("/no/such/program");
    expectOneLine(post(), "could not be started");
}

TEST_F(SessionBusNotifications, SayThatThereIsNoSessionBus) {
    variables["DBUS_SESSION_BUS_ADDRESS"] = "unix:path=" + (folder.path() / "none").string();
    const auto ended = post();

    expectOneLine(ended,
                  "cannot be reached, since there is no such bus: No such file or directory");
    EXPECT_THAT(ended.errors, HasSubstr("Log in to a desktop"));
}

TEST_F(SessionBusNotifications, SayThatTheSessionBusHasEnded) {
    startBus();
    bus->stop();

    expectOneLine(post(), "cannot be reached, since there is no such bus: Connection refused");
}

TEST_F(SessionBusNotifications, WaitForABusThatDoesNotAnswerOnlySoLong) {
    const auto path = folder.path() / "mute";
    const int listening = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    path.string().copy(address.sun_path, sizeof address.sun_path - 1);
    const auto* generic = reinterpret_cast<const sockaddr*>(&address);
    ASSERT_EQ(bind(listening, generic, sizeof address), 0);
    ASSERT_EQ(listen(listening, 1), 0);
    variables["DBUS_SESSION_BUS_ADDRESS"] = "unix:path=" + path.string();

    expectOneLine(post({"org.vlm.test", "300"}),
                  "cannot be reached, since there is no such bus: Connection timed out");
    EXPECT_LT(took, seconds(5));
    close(listening);
}

TEST_F(SessionBusNotifications, SayThatNothingNamesASessionBus) {
    expectOneLine(post(),
                  "cannot be reached, since there is no such bus: neither "
                  "DBUS_SESSION_BUS_ADDRESS nor XDG_RUNTIME_DIR is set");
}

TEST_F(SessionBusNotifications, SayThatAnAddressIsNone) {
    variables["DBUS_SESSION_BUS_ADDRESS"] = "nonsense";

    expectOneLine(post(), "cannot be reached, since there is no such bus");
}

TEST_F(SessionBusNotifications, FindTheBusInTheUsersRuntimeFolder) {
    startBus();
    const auto receiver = startReceiver();
    const std::string path = bus->address().substr(std::string("unix:path=").size());
    std::filesystem::create_directories(folder.path() / "runtime");
    std::filesystem::create_symlink(path.substr(0, path.find(',')), folder.path() / "runtime/bus");
    variables["DBUS_SESSION_BUS_ADDRESS"] = std::nullopt;
    variables["XDG_RUNTIME_DIR"] = folder.path() / "runtime";

    EXPECT_EQ(post().errors, "");

    EXPECT_TRUE(receiver->waitForOutput("org.vlm.test\n"));
}

TEST_F(SessionBusNotifications, ThatAreNoTextAreNotSent) {
    startBus();
    const auto receiver = startReceiver();

    EXPECT_THAT(post({"a\xFF"}).errors,
                AllOf(HasSubstr("was not delivered"), HasSubstr("cannot be sent")));
}

}  // namespace

}  // namespace vlm::test
