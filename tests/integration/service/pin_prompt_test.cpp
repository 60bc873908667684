// How the daemon asks for a PIN: on the caller's terminal, with a real pinentry program.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <fstream>

#include "hints_machine.h"
#include "pty.h"

namespace vlm::test {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

class PinPromptTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0)
            GTEST_SKIP() << "only root may have the name on a bus with the installed policy";
    }

    void start(const std::string& pinentry) {
        machine.startDaemon({"--pinentry", pinentry});
        machine.insertCard();
    }
    // A call from a terminal, as a command that a person types.
    std::vector<std::string> loginOnTerminal() const {
        auto command = machine.callCommand(kDaemon, machine.login());
        command.insert(command.begin() + 1, "--terminal");
        return command;
    }
    std::string file(const std::string& name) const {
        std::ifstream stream(machine.commonFolder() / name);
        std::string text;
        std::getline(stream, text, '\0');
        return text;
    }
    std::string noteTo(const std::string& name) const {
        return (machine.commonFolder() / name).string();
    }
    static bool isRunning(const std::string& pid) {
        return !pid.empty() && std::filesystem::exists("/proc/" + pid.substr(0, pid.find('\n')));
    }

    HintsMachine machine;
};

TEST_F(PinPromptTest, IsAnsweredByAProgramThatNeedsNoTerminal) {
    start(machine.answeringPinentry());

    EXPECT_EQ(machine.call(machine.login()), "res 0\n");
}

struct Ending {
    const char* why;
    const char* script;
    const char* result;
    const char* text;
};

TEST_F(PinPromptTest, TellsEachWayToGetNoPinApart) {
    const char* const answerTo =
        "echo OK\n"
        "while read -r line; do case $line in GETPIN) ";
    const Ending endings[] = {
        {"cancelled", "echo 'ERR 83886179 cancelled' ;; *) echo OK ;; esac; done", "res -2007\n",
         "cancelled"},
        {"timed out", "echo 'ERR 83886142 Timeout' ;; *) echo OK ;; esac; done", "res -2007\n",
         "in time"},
        {"failed", "echo 'ERR 1 no screen' ;; *) echo OK ;; esac; done", "res -2006\n",
         "no screen"},
        {"dies", "exit ;; *) echo OK ;; esac; done", "res -2006\n", "ended without an answer"},
        {"talks without end", "yes ;; *) echo OK ;; esac; done", "res -2006\n",
         "does not speak its protocol"},
        {"says one long line", "head -c 5000 /dev/zero ;; *) echo OK ;; esac; done", "res -2006\n",
         "does not speak its protocol"},
        {"enters a wrong PIN", "echo 'D 000000'; echo OK ;; *) echo OK ;; esac; done",
         "res -2008\n", "refused"},
    };
    start(noteTo("pinentry"));
    for (const auto& [why, script, result, text] : endings) {
        SCOPED_TRACE(why);
        std::filesystem::copy_file(machine.pinentry(std::string(answerTo) + script + "\n"),
                                   noteTo("pinentry"),
                                   std::filesystem::copy_options::overwrite_existing);

        const auto said = machine.call(machine.login());

        EXPECT_THAT(said, StartsWith(result));
        EXPECT_THAT(said, HasSubstr(text));
    }
}

TEST_F(PinPromptTest, SaysSoWhenThereIsNoPinentryProgram) {
    start("/nonexistent/pinentry");

    EXPECT_THAT(machine.call(machine.login()),
                testing::AllOf(StartsWith("res -2006\n"), HasSubstr("/nonexistent/pinentry")));
}

TEST_F(PinPromptTest, SaysSoWhenThereIsNobodyToAsk) {
    machine.startDaemon();
    machine.insertCard();

    EXPECT_THAT(machine.call(machine.login()),
                testing::AllOf(StartsWith("res -2006\n"), HasSubstr("there is no terminal")));
}

TEST_F(PinPromptTest, RunsOnTheTerminalOfTheCallerAsTheCaller) {
    start(machine.pinentry("exec 3>" + noteTo("told") +
                           "\n"
                           "id -u >&3; env >&3; tty >&3 2>/dev/null\n"
                           "echo OK\n"
                           "while read -r line; do\n"
                           "  echo \"$line\" >&3\n"
                           "  case $line in GETPIN) echo 'D 123456' ;; BYE) exit ;; esac\n"
                           "  echo OK\n"
                           "done\n"));
    setenv("VLM_TEST_SECRET", "of the daemon", 1);

    Pty terminal(loginOnTerminal(), machine.options(kNobodyUser));

    EXPECT_TRUE(terminal.waitFor("res 0")) << terminal.seen();
    EXPECT_THAT(file("told"), StartsWith("65534\n"));
    EXPECT_THAT(file("told"), HasSubstr("OPTION ttyname=" + terminal.path() + "\n"));
    EXPECT_THAT(file("told"), HasSubstr("SETDESC Enter the PIN of the card \"Card\""));
    EXPECT_THAT(file("told"), testing::Not(HasSubstr("SOFTHSM2_CONF")));
    EXPECT_THAT(file("told"), HasSubstr("BYE"));
}

TEST_F(PinPromptTest, AsksOnATerminalWithTheRealProgram) {
    start("/usr/bin/pinentry-tty");
    Pty terminal(loginOnTerminal(), machine.options());

    ASSERT_TRUE(terminal.waitFor("PIN:")) << terminal.seen();
    EXPECT_THAT(terminal.seen(), HasSubstr("\"Alice Example\""));
    terminal.type("123456\n");

    EXPECT_TRUE(terminal.waitFor("res 0")) << terminal.seen();
    EXPECT_THAT(terminal.seen(), testing::Not(HasSubstr("123456")));
    EXPECT_TRUE(terminal.echoes());
}

TEST_F(PinPromptTest, IsCancelledOnATerminalWithTheRealProgram) {
    start("/usr/bin/pinentry-tty");
    Pty terminal(loginOnTerminal(), machine.options());

    ASSERT_TRUE(terminal.waitFor("PIN:")) << terminal.seen();
    terminal.type("\x04");

    EXPECT_TRUE(terminal.waitFor("res -2007")) << terminal.seen();
}

TEST_F(PinPromptTest, EndsAndPutsTheTerminalBackWhenTheCallerIsGone) {
    start("/usr/bin/pinentry-tty");
    Pty terminal(loginOnTerminal(), machine.options());
    ASSERT_TRUE(terminal.waitFor("PIN:")) << terminal.seen();
    ASSERT_TRUE(eventually([&] { return !terminal.echoes(); }));

    terminal.kill();

    EXPECT_TRUE(eventually([&] { return terminal.echoes(); }));
}

TEST_F(PinPromptTest, EndsWithItsCaller) {
    start(machine.pinentry("echo $$ >" + noteTo("pid") + "; echo OK; exec sleep 1000\n"));
    auto caller =
        std::make_unique<Child>(machine.callCommand(kDaemon, machine.login()), machine.options());
    ASSERT_TRUE(eventually([&] { return isRunning(file("pid")); }));

    caller.reset();

    EXPECT_TRUE(eventually([&] { return !isRunning(file("pid")); }));
    EXPECT_EQ(machine.call({"op=6", "str1=root"}), "res 0\n");
}

TEST_F(PinPromptTest, EndsWithTheDaemon) {
    for (const int signal : {SIGTERM, SIGKILL}) {
        std::filesystem::remove(noteTo("pid"));
        start(machine.pinentry("echo $$ >" + noteTo("pid") + "; echo OK; exec sleep 1000\n"));
        Child caller(machine.callCommand(kDaemon, machine.login()), machine.options());
        ASSERT_TRUE(eventually([&] { return isRunning(file("pid")); }));

        machine.daemon().signal(signal);

        EXPECT_TRUE(machine.daemon().wait());
        EXPECT_TRUE(eventually([&] { return !isRunning(file("pid")); })) << signal;
    }
}

TEST_F(PinPromptTest, KeepsNobodyElseWaiting) {
    start(machine.pinentry("echo $$ >" + noteTo("pid") + "; echo OK; exec sleep 1000\n"));
    Child waiting(machine.callCommand(kDaemon, machine.login()), machine.options());
    ASSERT_TRUE(eventually([&] { return isRunning(file("pid")); }));

    EXPECT_THAT(machine.call({"op=1", "uid=-1"}), HasSubstr("Alice Example"));
    EXPECT_EQ(machine.call(machine.login({"str2=123456"})), "res 0\n");
}

}  // namespace
}  // namespace vlm::test
