#include "tests/integration/linux/child.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <csignal>
#include <system_error>

#include "platform/linux/file_descriptor.h"

namespace vlm::test {

using std::chrono::milliseconds;

TEST(ChildTest, CollectsStatusAndBothStreams) {
    const auto ended = run({"sh", "-c", "cat; echo problem >&2; exit 3"}, {}, "text");

    EXPECT_EQ(ended.status, 3);
    EXPECT_EQ(ended.output, "text");
    EXPECT_EQ(ended.errors, "problem\n");
}

TEST(ChildTest, ReportsTheSignalThatEndedIt) {
    EXPECT_EQ(run({"sh", "-c", "kill -TERM $$"}).status, 128 + SIGTERM);
}

TEST(ChildTest, SetsAndTakesAwayVariables) {
    ::setenv("VLM_TAKEN_AWAY", "there", 1);

    const auto ended =
        run({"sh", "-c", "echo \"${ADDED-none} ${VLM_TAKEN_AWAY-none}\""},
            {.environment = {{"ADDED", "yes"}, {"VLM_TAKEN_AWAY", std::nullopt}}, .user = {}});

    EXPECT_EQ(ended.output, "yes none\n");
}

TEST(ChildTest, WaitsNoLongerThanItIsTold) {
    Child child({"cat"});

    EXPECT_EQ(child.wait(milliseconds(1)), std::nullopt);
    EXPECT_FALSE(child.waitForOutput("text", milliseconds(1)));

    child.write("some text");
    EXPECT_TRUE(child.waitForOutput("text"));
    child.closeInput();
    EXPECT_EQ(child.wait(), 0);
}

TEST(ChildTest, EndsWithItsObjectTogetherWithItsOwnChildren) {
    platform::FileDescriptor grandchild;
    {
        Child child({"sh", "-c", "sleep 100 & echo $!; wait"});
        ASSERT_TRUE(child.waitForOutput("\n"));
        const int id = std::stoi(child.output());
        grandchild = platform::FileDescriptor(static_cast<int>(::syscall(SYS_pidfd_open, id, 0)));
        ASSERT_TRUE(grandchild);
    }

    pollfd ended{grandchild.get(), POLLIN, 0};
    EXPECT_EQ(::poll(&ended, 1, static_cast<int>(Child::kPatience.count())), 1);
}

TEST(ChildTest, SaysWhichProgramCannotBeStarted) {
    try {
        Child child({"/nonexistent/program"});
        FAIL();
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code(), std::errc::no_such_file_or_directory);
        EXPECT_NE(std::string(error.what()).find("/nonexistent/program"), std::string::npos);
    }
}

}  // namespace vlm::test
