// The daemon on a bus with the policy that gets installed, with software cards.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <pwd.h>
#include <unistd.h>

#include <csignal>
#include <fstream>

#include "hints_machine.h"

namespace vlm::test {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

std::string ownName() {
    const auto* account = getpwuid(geteuid());
    return account ? account->pw_name : "root";
}

class DaemonTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0)
            GTEST_SKIP() << "only root may have the name on a bus with the installed policy";
    }

    HintsMachine machine;
    const std::string me = ownName();
};

TEST_F(DaemonTest, PairsAKeyThatTheCardProvedAndKeepsThePairing) {
    machine.startDaemon();
    machine.insertCard();
    EXPECT_THAT(machine.call({"op=1", "uid=-1"}), HasSubstr("Alice Example"));

    EXPECT_EQ(machine.call(machine.login({"str2=123456"})), "res 0\n");
    EXPECT_EQ(machine.call(machine.pair(me)), "res 0\n");
    EXPECT_EQ(machine.call({"op=6", "str1=" + me}), "res 1\n");

    machine.stopDaemon();
    machine.startDaemon();
    EXPECT_EQ(machine.call({"op=6", "str1=" + me}), "res 1\n");
    EXPECT_THAT(machine.call({"op=4", "num1=1", "str1=" + me}), HasSubstr(machine.hash()));

    EXPECT_EQ(machine.call({"op=3", "dat1=" + machine.hash(), "str1=" + me}), "res 0\n");
    EXPECT_EQ(machine.call({"op=6", "str1=" + me}), "res 0\n");
    EXPECT_THAT(machine.call({"op=3", "dat1=" + machine.hash(), "str1=" + me}),
                StartsWith("res -2012\nerror Unpairing " + me));
}

TEST_F(DaemonTest, PairsNothingWithoutAProof) {
    machine.startDaemon();
    machine.insertCard();

    EXPECT_THAT(machine.call(machine.pair(me)), StartsWith("res -2011\nerror Pairing " + me));
    EXPECT_EQ(machine.call({"op=6", "str1=" + me}), "res 0\n");
}

TEST_F(DaemonTest, TakesNoWrongPinForAProof) {
    machine.startDaemon();
    machine.insertCard();

    EXPECT_THAT(machine.call(machine.login({"str2=654321"})),
                testing::AllOf(StartsWith("res -2008\nerror Logging in"), HasSubstr("refused")));
    EXPECT_THAT(machine.call(machine.pair(me)), StartsWith("res -2011"));
}

TEST_F(DaemonTest, LetsOthersAskAboutThemselvesAndPairNobodyElse) {
    machine.startDaemon();
    machine.insertCard();
    ASSERT_EQ(machine.call(machine.login({"str2=123456"})), "res 0\n");
    ASSERT_EQ(machine.call(machine.pair(me)), "res 0\n");

    const auto pairing = machine.call(machine.pair(me), kNobodyUser);
    const auto asking = machine.call({"op=6", "str1=" + me}, kNobodyUser);
    const auto listing = machine.call({"op=1", "uid=-1"}, kNobodyUser);

    EXPECT_THAT(pairing, testing::AllOf(StartsWith("res -2001\n"), HasSubstr("administrator")));
    EXPECT_THAT(asking, StartsWith("res -2001\n"));
    EXPECT_EQ(machine.call({"op=6", "str1=nobody"}, kNobodyUser), "res 0\n");
    EXPECT_THAT(listing, testing::AllOf(HasSubstr("Alice Example"), HasSubstr("another account"),
                                        testing::Not(HasSubstr(me))));
}

TEST_F(DaemonTest, PairsOthersOnlyWhereAnAdministratorCanBeAsked) {
    machine.startDaemon();
    machine.insertCard();

    EXPECT_THAT(machine.call(machine.pair("nobody"), kNobodyUser), StartsWith("res -2011\n"));
    ASSERT_EQ(machine.call(machine.login({"str2=123456"}), kNobodyUser), "res 0\n");
    EXPECT_THAT(machine.call(machine.pair("nobody"), kNobodyUser),
                testing::AllOf(StartsWith("res -2016\n"), HasSubstr("in no session")));
    EXPECT_EQ(machine.call({"op=6", "str1=nobody"}), "res 0\n");
}

TEST_F(DaemonTest, AnswersRequestsThatAreNone) {
    machine.startDaemon();
    const std::string address = "--address=" + machine.systemBus().address();
    const auto exchange = [&](std::vector<std::string> content) {
        std::vector<std::string> command{
            "busctl",  address, "call", kDaemon, "/org/vlm/token/hints", "org.vlm.token.hints",
            "Exchange"};
        std::ranges::move(content, std::back_inserter(command));
        return run(command);
    };

    EXPECT_THAT(exchange({"a{sv}", "0"}).output, HasSubstr("\"res\" x -2000"));
    EXPECT_THAT(exchange({"a{sv}", "1", "op", "s", "one"}).output, HasSubstr("\"res\" x -2000"));
    EXPECT_THAT(exchange({"a{sv}", "1", "op", "d", "1.5"}).output, HasSubstr("\"res\" x -2000"));
    EXPECT_THAT(exchange({"a{sv}", "2", "op", "t", "6", "op", "t", "6"}).output,
                HasSubstr("\"res\" x -2000"));
    EXPECT_THAT(exchange({"s", "hello"}).errors, HasSubstr("Invalid"));
    EXPECT_THAT(exchange({}).errors, HasSubstr("Invalid"));
    EXPECT_THAT(machine.call({"op=99"}), StartsWith("res -2000\n"));
    EXPECT_THAT(machine.call({"op=6", "str1=" + std::string(100'000, 'x')}),
                StartsWith("res -2000\n"));

    EXPECT_EQ(machine.call({"op=6", "str1=" + me}), "res 0\n");
}

TEST_F(DaemonTest, CanBeCalledByHandAsTheReadmeShows) {
    machine.startDaemon();
    machine.insertCard();
    const std::string address = "--address=" + machine.systemBus().address();

    const auto isPaired =
        run({"busctl", address, "call", kDaemon, "/org/vlm/token/hints", "org.vlm.token.hints",
             "Exchange", "a{sv}", "2", "op", "t", "6", "str1", "s", me});
    const auto listing =
        run({"busctl", address, "call", kDaemon, "/org/vlm/token/hints", "org.vlm.token.hints",
             "Exchange", "a{sv}", "2", "op", "t", "1", "uid", "x", "--", "-1"});
    const auto description = run(
        {"busctl", address, "introspect", kDaemon, "/org/vlm/token/hints", "org.vlm.token.hints"});

    EXPECT_EQ(isPaired.output, "a{sv} 1 \"res\" x 0\n");
    EXPECT_THAT(listing.output + listing.errors, StartsWith("a{sv} 1 \"res\" ay "));
    EXPECT_THAT(description.output, testing::ContainsRegex("\\.Exchange +method +a\\{sv\\} +a"));
}

TEST_F(DaemonTest, EndsCleanlyWhenItIsAskedTo) {
    for (const int signal : {SIGTERM, SIGINT}) {
        machine.startDaemon();

        machine.daemon().signal(signal);

        EXPECT_EQ(machine.daemon().wait(), 0);
    }
}

TEST_F(DaemonTest, EndsWithALineWhenTheBusIsGone) {
    machine.startDaemon();

    machine.systemBus().stop();

    EXPECT_EQ(machine.daemon().wait(), 1);
    EXPECT_THAT(machine.daemon().errors(), HasSubstr("the connection to the bus was lost"));
}

TEST_F(DaemonTest, RunsOnce) {
    machine.startDaemon();

    const auto second = run(machine.daemonCommand(), machine.options());

    EXPECT_EQ(second.status, 1);
    EXPECT_THAT(second.errors, HasSubstr("another program has the name"));
    EXPECT_TRUE(machine.systemBus().hasOwner(kDaemon));
}

TEST_F(DaemonTest, TakesNoNameBeforeItsPairingsAreThere) {
    const auto file = machine.folder().write("state/hints.sqlite3", "no database at all");
    chmod(file.c_str(), 0600);
    chmod(file.parent_path().c_str(), 0700);

    const auto ended = run(machine.daemonCommand(), machine.options());

    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.errors, HasSubstr(file.string()));
}

TEST_F(DaemonTest, MayNotBeImpersonated) {
    const auto ended =
        run(machine.daemonCommand({"--database", machine.commonFolder() / "own" / "hints"}),
            machine.options(kNobodyUser));

    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.errors, HasSubstr("does not give the name"));
}

TEST(DaemonWithoutABusTest, SaysThatThereIsNone) {
    Child::Options options;
    options.environment = {{"DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nonexistent/bus"}};

    const auto ended = run({VLM_HINTS_SERVICE, "--system"}, options);

    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.errors, StartsWith("vlmhintsd: the system bus cannot be reached"));
}

}  // namespace
}  // namespace vlm::test
