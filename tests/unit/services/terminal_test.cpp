#include "services/hints/terminal.h"

#include <gtest/gtest.h>
#include <sys/sysmacros.h>

namespace vlm::service {
namespace {

struct StatRow {
    const char* why;
    std::string_view stat;
    dev_t number;
};

TEST(TerminalTest, ReadsTheTerminalOfAProcess) {
    const StatRow rows[] = {
        {"a pseudo terminal", "42 (bash) S 1 42 42 34819 42 4194304", makedev(136, 3)},
        {"no terminal", "42 (daemon) S 1 42 42 0 -1 4194304", 0},
        {"a virtual console", "42 (login) S 1 42 42 1025 42", makedev(4, 1)},
        {"a pseudo terminal with a large number", "42 (x) S 1 42 42 1083400 42", makedev(136, 264)},
        {"a name that looks like fields", "42 (a) S 1 42 42 1025 (b) S 1 42 42 34819 42",
         makedev(136, 3)},
        {"a name with a line end", "42 (a\n) b) R 1 42 42 34819 42", makedev(136, 3)},
        {"nothing", "", 0},
        {"too few fields", "42 (bash) S 1", 0},
        {"no number", "42 (bash) S 1 42 42 x", 0},
    };
    for (const auto& [why, stat, number] : rows) EXPECT_EQ(terminalNumber(stat), number) << why;
}

TEST(TerminalTest, FindsTheTerminalsThatPeopleSitAt) {
    EXPECT_EQ(terminalPath(makedev(136, 3)), "/dev/pts/3");
    EXPECT_EQ(terminalPath(makedev(136, 300)), "/dev/pts/300");
    EXPECT_EQ(terminalPath(makedev(4, 2)), "/dev/tty2");
    EXPECT_EQ(terminalPath(makedev(4, 64)), "/dev/ttyS0");
}

TEST(TerminalTest, FindsNothingElse) {
    EXPECT_EQ(terminalPath(0), std::nullopt);
    EXPECT_EQ(terminalPath(makedev(4, 0)), std::nullopt);  // whatever console is in front
    EXPECT_EQ(terminalPath(makedev(1, 3)), std::nullopt);  // no terminal at all
    EXPECT_EQ(terminalPath(makedev(5, 1)), std::nullopt);
}

TEST(TerminalTest, IsNoneForAProcessThatIsNotKnown) {
    EXPECT_FALSE(Terminal::of({1000, 0, ":1.1"}));
    EXPECT_FALSE(Terminal::of({1000, -1, ":1.1"}));
}

}  // namespace
}  // namespace vlm::service
