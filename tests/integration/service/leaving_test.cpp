// When the daemon leaves, when it stays, and what others find when it was started anew.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>

#include "hints_machine.h"

namespace vlm::test {
namespace {

using namespace std::chrono_literals;
using testing::HasSubstr;

class LeavingTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0)
            GTEST_SKIP() << "only root may have the name on a bus with the installed policy";
    }

    // A bus that starts a daemon which leaves after 0.3 s.
    void start(std::vector<std::string> moreArguments = {}) {
        moreArguments.insert(moreArguments.end(), {"--idle-seconds", "0.3"});
        machine.makeDaemonStartable(moreArguments);
        machine.insertCard();
    }
    bool leaves() const {
        return eventually([this] { return machine.daemonConnection().empty(); });
    }
    // Looks for three idle times whether that daemon is still there.
    bool stays(const std::string& connection) const {
        const auto end = std::chrono::steady_clock::now() + 900ms;
        while (std::chrono::steady_clock::now() < end)
            if (connection.empty() || machine.daemonConnection() != connection) return false;
        return true;
    }

    HintsMachine machine;
};

TEST_F(LeavingTest, HappensWhenNobodyAsks) {
    Child daemon(machine.daemonCommand({"--idle-seconds", "0.1"}), machine.options());

    EXPECT_EQ(daemon.wait(), 0) << daemon.errors();

    EXPECT_THAT(daemon.errors(), HasSubstr("leaving after a quiet time"));
}

TEST_F(LeavingTest, IsUndoneByTheNextCallWhichFindsThePairings) {
    start();
    ASSERT_EQ(machine.call(machine.login({"str2=123456"})), "res 0\n");
    ASSERT_EQ(machine.call(machine.pair("root")), "res 0\n");
    const auto before = machine.daemonConnection();
    ASSERT_TRUE(leaves());

    EXPECT_EQ(machine.call({"op=6", "str1=root"}), "res 1\n");
    EXPECT_NE(machine.daemonConnection(), before);
}

TEST_F(LeavingTest, WaitsForTheEndOfAPinPrompt) {
    const auto asked = machine.commonFolder() / "asked";
    const auto go = machine.commonFolder() / "go";
    ASSERT_EQ(mkfifo(go.c_str(), 0600), 0);
    start({"--pinentry", machine.pinentry("echo OK\n"
                                          "while read -r line; do\n"
                                          "  case $line in GETPIN)\n"
                                          "    : >" +
                                          asked.string() + "; read -r pin <" + go.string() +
                                          "; echo \"D $pin\" ;;\n"
                                          "  esac\n"
                                          "  echo OK\n"
                                          "done\n")});
    Child login(machine.callCommand(kDaemon, machine.login()), machine.options());
    ASSERT_TRUE(eventually([&] { return std::filesystem::exists(asked); }));

    ASSERT_TRUE(stays(machine.daemonConnection()));

    std::ofstream(go) << "123456\n";
    EXPECT_EQ(login.wait(), 0);
    EXPECT_EQ(login.output(), "res 0\n");
}

TEST_F(LeavingTest, WaitsForTheEndOfAProofOrItsPairing) {
    start();
    ASSERT_EQ(machine.call(machine.login({"str2=123456"})), "res 0\n");

    EXPECT_TRUE(stays(machine.daemonConnection()));

    EXPECT_EQ(machine.call(machine.pair("root")), "res 0\n");
    EXPECT_TRUE(leaves());
}

TEST_F(LeavingTest, IsNotPutOffByRegistrations) {
    start();
    const auto registerInstance = [&] {
        run({"busctl", "--address=" + machine.systemBus().address(), "--auto-start=no", "call",
             kDaemon, "/org/vlm/token/hints", "org.vlm.token.hints.Prompters", "RegisterPrompter"});
    };

    EXPECT_TRUE(eventually([&] {
        registerInstance();
        return machine.daemonConnection().empty();
    }));
}

}  // namespace
}  // namespace vlm::test
