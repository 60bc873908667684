// main(), compiled under another name, on the fake platform.

#include <csignal>

#include "home_folder.h"
#include "tool_fixture.h"

int vlmbindMain(int argc, char* argv[]);

namespace vlm {
namespace {

class Main : public ToolTest {
protected:
    void SetUp() override {
        ToolTest::SetUp();
        home.set("/");
    }

    int run(const Texts& options) {
        fakes::Arguments arguments(options);
        testing::internal::CaptureStdout();
        testing::internal::CaptureStderr();
        const int status = vlmbindMain(arguments.count(), arguments.values());
        output = testing::internal::GetCapturedStdout();
        complaints = testing::internal::GetCapturedStderr();
        return status;
    }

    std::string output;
    std::string complaints;
    fakes::HomeFolder home;
};

TEST_F(Main, RunsAsTheAgentWithoutArguments) {
    application().statusOfLoop = 7;

    EXPECT_EQ(run({}), 7);

    EXPECT_TRUE(application().isReceiving());
    EXPECT_EQ(sandbox().entered.size(), 1U);
    EXPECT_FALSE(debugged("using command line arguments"));
}

TEST_F(Main, RunsTheCommandLineWithAnyArgument) {
    EXPECT_EQ(run({"-i"}), 0);
    EXPECT_EQ(run({""}), 255);

    EXPECT_TRUE(debugged("using command line arguments"));
    EXPECT_EQ(complaints, "");
}

TEST_F(Main, PrintsOnStandardOutput) {
    EXPECT_EQ(run({"-u", ""}), 255);

    EXPECT_EQ(output, "Invalid user name specified.\n");
    EXPECT_EQ(complaints, "");
}

TEST_F(Main, SaysThatItStartsAndEntersTheSandboxBeforeItLooksAtTheArguments) {
    run({"-v"});

    const auto lines = debugLines();
    ASSERT_GE(lines.size(), 2U);
    EXPECT_EQ(lines[0], "starting");
    EXPECT_EQ(lines[1], "using command line arguments");
    EXPECT_EQ(sandbox().entered.size(), 1U);
}

using MainDeathTest = Main;

TEST_F(MainDeathTest, AbortsInBothModesWhenHomeIsNotSet) {
    home.unset();

    EXPECT_EXIT(run({}), testing::KilledBySignal(SIGABRT), "");
    EXPECT_EXIT(run({"-i"}), testing::KilledBySignal(SIGABRT), "");
}

TEST_F(MainDeathTest, AbortsWhenTheSandboxCannotBeEntered) {
    sandbox().answer = {-1, "no such profile"};

    EXPECT_EXIT(run({"-i"}), testing::KilledBySignal(SIGABRT), "");
}

}  // namespace
}  // namespace vlm
