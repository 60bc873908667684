// The user's instance on a session bus of its own, and the daemon that it speaks to.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "hints_machine.h"

namespace vlm::test {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

TEST(UserInstanceWithoutADaemonTest, SaysThatTheDaemonDoesNotAnswer) {
    HintsMachine machine;
    machine.startAgent(std::nullopt);

    EXPECT_THAT(machine.callAgent({"op=1", "uid=-1"}),
                testing::AllOf(StartsWith("res -2014\n"), HasSubstr(kDaemon)));
}

TEST(UserInstanceWithoutADaemonTest, RefusesWhatOnlyTheDaemonDoes) {
    HintsMachine machine;
    machine.startAgent(std::nullopt);

    for (const std::string operation : {"2", "3"})
        EXPECT_THAT(
            machine.callAgent({"op=" + operation, "dat1=" + std::string(64, '0'), "str1=alice"}),
            testing::AllOf(StartsWith("res -2002\n"), HasSubstr(kDaemon)));
    EXPECT_THAT(machine.callAgent({"op=6", "str1=alice"}), StartsWith("res -2002\n"));
}

TEST(UserInstanceWithoutADaemonTest, ServesWithoutASystemBus) {
    HintsMachine machine;
    machine.systemBus().stop();
    machine.startAgent(std::nullopt);

    EXPECT_THAT(machine.callAgent({"op=1", "uid=-1"}), StartsWith("res -2014\n"));
    EXPECT_TRUE(machine.agent().waitForErrors("cannot ask for PINs on this desktop"));
}

class UserInstanceTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0) GTEST_SKIP() << "only root can start a daemon and another user's agent";
    }

    void start(const std::string& pinentry) {
        machine.startDaemon();
        machine.insertCard();
        machine.startAgent(kNobodyUser, {"--pinentry", pinentry});
        ASSERT_TRUE(isRegistered());
    }
    bool isRegistered() { return machine.agent().waitForErrors("through this instance"); }
    int timesRegistered() {
        // Takes in what the instance has logged meanwhile.
        machine.agent().waitForErrors("(never)", std::chrono::milliseconds(10));
        const std::string line = "through this instance";
        int times = 0;
        for (auto at = machine.agent().errors().find(line); at != std::string::npos;
             at = machine.agent().errors().find(line, at + 1))
            ++times;
        return times;
    }
    bool hasDaemonLeft() const {
        return eventually([this] { return machine.daemonConnection().empty(); });
    }
    // Whether a daemon comes within a second that nobody has asked for.
    bool appearsSoon() const {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(1);
        while (std::chrono::steady_clock::now() < end)
            if (!machine.daemonConnection().empty()) return true;
        return false;
    }
    // Its name on the system bus.
    std::string connectionOfTheAgent() {
        std::istringstream list(run({"busctl", "--address=" + machine.systemBus().address(), "list",
                                     "--unique", "--no-legend"})
                                    .output);
        std::string name, pid;
        for (std::string line; std::getline(list, line);) {
            std::istringstream(line) >> name >> pid;
            if (pid == std::to_string(machine.agent().pid())) return name;
        }
        return "(it is not on the bus)";
    }
    std::string note(const std::string& name) const {
        std::ifstream stream(machine.commonFolder() / name);
        std::string text;
        std::getline(stream, text);
        return text;
    }

    HintsMachine machine;
};

TEST_F(UserInstanceTest, ShowsItsMemoryToNoOtherProgramOfItsUser) {
    start(machine.answeringPinentry());
    const Child open({"sleep", "60"}, machine.options(kNobodyUser));
    const auto read = [&](const Child& program) {
        // The kernel asks the same for each file that shows memory.
        const auto file = "/proc/" + std::to_string(program.pid()) + "/environ";
        return run({"cat", file}, machine.options(kNobodyUser));
    };

    // Until it runs the program it is closed, too.
    EXPECT_TRUE(eventually([&] { return read(open).status == 0; }));

    const auto refused = read(machine.agent());
    EXPECT_NE(refused.status, 0);
    EXPECT_THAT(refused.errors, HasSubstr("Permission denied"));
}

TEST_F(UserInstanceTest, PassesListingsOn) {
    start(machine.answeringPinentry());

    EXPECT_THAT(machine.callAgent({"op=1", "uid=-1"}, kNobodyUser), HasSubstr("Alice Example"));
    EXPECT_THAT(machine.callAgent({"op=1", "uid=0"}, kNobodyUser), StartsWith("res -2001\n"));
}

TEST_F(UserInstanceTest, SaysOfAUserWithoutALoginKeyringThatThereIsNone) {
    start(machine.answeringPinentry());
    const std::vector<std::string> name{"op=8", "uid=65534"};
    const std::vector<std::string> unlock{"op=5", "uid=65534", "str1=x"};
    const auto noKeyring = testing::AllOf(StartsWith("res -2021\n"), HasSubstr("no login keyring"));

    EXPECT_THAT(machine.callAgent(unlock, kNobodyUser), noKeyring);
    EXPECT_THAT(machine.call(unlock), noKeyring);
    EXPECT_THAT(machine.call(name), noKeyring);
    EXPECT_THAT(machine.call(name, kNobodyUser), noKeyring);
    EXPECT_THAT(machine.call(name, kOtherUser), StartsWith("res -2001\n"));
    EXPECT_THAT(machine.call({"op=8", "uid=4711"}),
                testing::AllOf(StartsWith("res -2021\n"), HasSubstr("not logged in")));
}

TEST_F(UserInstanceTest, AsksItsUserForThePinOfALogin) {
    start(machine.answeringPinentry());

    EXPECT_EQ(machine.callAgent(machine.login(), kNobodyUser), "res 0\n");
}

TEST_F(UserInstanceTest, AsksAlsoForAProgramOfItsUserThatCallsTheDaemonItself) {
    start(machine.answeringPinentry());

    EXPECT_EQ(machine.call(machine.login(), kNobodyUser), "res 0\n");
}

TEST_F(UserInstanceTest, AsksForNoOtherUser) {
    start(machine.answeringPinentry());

    EXPECT_THAT(machine.call(machine.login(), kOtherUser), StartsWith("res -2006\n"));
    EXPECT_THAT(machine.call(machine.login()), StartsWith("res -2006\n"));
}

TEST_F(UserInstanceTest, TellsThatItsUserCancelled) {
    start(machine.pinentry(
        "echo OK\n"
        "while read -r line; do\n"
        "  case $line in GETPIN) echo 'ERR 83886179 cancelled' ;; *) echo OK ;; esac\n"
        "done\n"));

    EXPECT_THAT(machine.callAgent(machine.login(), kNobodyUser),
                testing::AllOf(StartsWith("res -2007\n"), HasSubstr("cancelled")));
}

TEST_F(UserInstanceTest, RegistersAgainWhenTheDaemonStartsAgain) {
    start(machine.answeringPinentry());

    machine.stopDaemon();
    machine.startDaemon();

    EXPECT_TRUE(
        eventually([&] { return machine.callAgent(machine.login(), kNobodyUser) == "res 0\n"; }));
}

TEST_F(UserInstanceTest, RegistersAgainWhenSomebodyElseBringsTheDaemonBack) {
    machine.makeDaemonStartable({"--idle-seconds", "0.3"});
    machine.insertCard();
    machine.startAgent(kNobodyUser, {"--pinentry", machine.answeringPinentry()});
    ASSERT_TRUE(hasDaemonLeft());
    const auto before = timesRegistered();

    machine.call({"op=1", "uid=-1"});

    EXPECT_TRUE(eventually([&] { return timesRegistered() == before + 1; }));
}

TEST_F(UserInstanceTest, AsksForTheRequestThatStartedTheDaemon) {
    machine.makeDaemonStartable({"--idle-seconds", "0.3"});
    machine.insertCard();
    machine.startAgent(kNobodyUser, {"--pinentry", machine.answeringPinentry()});
    ASSERT_TRUE(hasDaemonLeft());

    EXPECT_EQ(machine.call(machine.login(), kNobodyUser), "res 0\n");
}

TEST_F(UserInstanceTest, AsksForTheForwardedRequestThatStartedTheDaemon) {
    machine.makeDaemonStartable({"--idle-seconds", "0.3"});
    machine.insertCard();
    machine.startAgent(kNobodyUser, {"--pinentry", machine.answeringPinentry()});
    ASSERT_TRUE(hasDaemonLeft());

    EXPECT_EQ(machine.callAgent(machine.login(), kNobodyUser), "res 0\n");
}

TEST_F(UserInstanceTest, LooksAtTheCardsAtItsStartAndLetsTheDaemonLeave) {
    // More than between its two looks.
    machine.makeDaemonStartable({"--idle-seconds", "2"});
    machine.startAgent(kNobodyUser);
    ASSERT_TRUE(isRegistered());

    EXPECT_TRUE(hasDaemonLeft());
    EXPECT_FALSE(appearsSoon());
}

TEST_F(UserInstanceTest, IsForgottenWhenItEnds) {
    start(machine.answeringPinentry());
    ASSERT_EQ(machine.call(machine.login(), kNobodyUser), "res 0\n");

    machine.agent().signal(SIGTERM);
    ASSERT_EQ(machine.agent().wait(), 0);

    EXPECT_THAT(machine.call(machine.login(), kNobodyUser), StartsWith("res -2006\n"));
}

TEST_F(UserInstanceTest, EndsThePromptWhenTheCallerIsGone) {
    const auto pid = [&] { return note("pid"); };
    const auto isOpen = [&] { return !pid().empty() && std::filesystem::exists("/proc/" + pid()); };
    start(machine.pinentry("echo $$ >" + (machine.commonFolder() / "pid").string() +
                           "; echo OK; exec sleep 1000\n"));
    auto caller = std::make_unique<Child>(machine.callCommand(kAgent, machine.login()),
                                          machine.options(kNobodyUser));
    ASSERT_TRUE(eventually(isOpen));

    caller.reset();

    EXPECT_TRUE(eventually([&] { return !isOpen(); }));
}

TEST_F(UserInstanceTest, GivesNoPinToAnotherProgram) {
    start(machine.answeringPinentry());
    const std::string address = "--address=" + machine.systemBus().address();
    const auto ask = [&](std::optional<uid_t> user) {
        return run({"busctl",
                    address,
                    "call",
                    connectionOfTheAgent(),
                    "/org/vlm/token/hints",
                    "org.vlm.token.hints.Prompter",
                    "AskPin",
                    "a{sv}",
                    "4",
                    "card",
                    "s",
                    "Card",
                    "identity",
                    "s",
                    "Alice",
                    "state",
                    "t",
                    "0",
                    "account",
                    "s",
                    ""},
                   machine.options(user));
    };

    EXPECT_THAT(ask(std::nullopt).output, HasSubstr("123456"));
    EXPECT_THAT(ask(kNobodyUser).errors, HasSubstr("Access denied"));
    EXPECT_THAT(ask(kOtherUser).errors, HasSubstr("Access denied"));
}

}  // namespace
}  // namespace vlm::test
