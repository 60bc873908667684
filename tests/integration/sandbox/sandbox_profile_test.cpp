#include "platform/linux/sandbox_profile.h"

#include <gtest/gtest.h>

namespace vlm::platform {

namespace {

const std::vector<SandboxParameter> kParameters = {{"HOME_DIR", "/home/alice"},
                                                   {"CACHE", "/var/cache/a b"}};

}  // namespace

TEST(SandboxProfileTest, ListsItsRulesInOrder) {
    const auto answer = parseSandboxProfile(
        "# comment\n"
        "\n"
        "read /usr\n"
        "  write \t$(HOME_DIR)/.config/vlm  \n"
        "read $(CACHE)\n"
        "socket unix\n",
        kParameters);

    ASSERT_TRUE(answer.profile) << answer.errorText;
    EXPECT_EQ(answer.profile->paths,
              (std::vector<PathRule>{{PathAccess::Read, "/usr", 3},
                                     {PathAccess::Write, "/home/alice/.config/vlm", 4},
                                     {PathAccess::Read, "/var/cache/a b", 5}}));
    EXPECT_TRUE(answer.profile->unixSockets);
}

TEST(SandboxProfileTest, AllowsNothingWhenItSaysNothing) {
    for (const char* text : {"", "\n", "# read /", "   \n\t\n"}) {
        const auto answer = parseSandboxProfile(text, {});

        ASSERT_TRUE(answer.profile) << answer.errorText;
        EXPECT_TRUE(answer.profile->paths.empty());
        EXPECT_FALSE(answer.profile->unixSockets);
    }
}

TEST(SandboxProfileTest, TakesThePathToTheEndOfTheLine) {
    const auto answer = parseSandboxProfile("read /a b # c\nread /..a/b..", {});

    ASSERT_TRUE(answer.profile) << answer.errorText;
    EXPECT_EQ(answer.profile->paths[0].path, "/a b # c");
    EXPECT_EQ(answer.profile->paths[1].path, "/..a/b..");
}

TEST(SandboxProfileTest, TakesAValueAsItIsWhateverItHolds) {
    const std::string strange = "/home/$(CACHE)/a b\nread /\n# ../..";
    const auto answer =
        parseSandboxProfile("read $(HOME_DIR)/x\n", {{"HOME_DIR", strange}, {"CACHE", "/secret"}});

    ASSERT_TRUE(answer.profile) << answer.errorText;
    EXPECT_EQ(answer.profile->paths,
              (std::vector<PathRule>{{PathAccess::Read, strange + "/x", 1}}));
}

TEST(SandboxProfileTest, RefusesAMalformedLine) {
    struct Row {
        std::string_view text;
        const char* error;
        const char* why;
    };
    using namespace std::string_view_literals;
    const Row rows[] = {
        {"allow /", "line 1: the word \"allow\" is unknown", "an unknown word"},
        {"READ /", "line 1: the word \"READ\" is unknown", "words are in lower case"},
        {"read/usr", "line 1: the word \"read/usr\" is unknown", "no blank after the word"},
        {"read", "line 1: the path is missing", "no path"},
        {"read   ", "line 1: the path is missing", "only blanks for a path"},
        {"read usr", "line 1: the path is not absolute", "a relative path"},
        {"read ~/x", "line 1: the path is not absolute", "no shell expands it"},
        {"read /usr/../etc", "line 1: a path goes down only, without \"..\"", "a step upwards"},
        {"read $(HOME_DIR)/..", "line 1: a path goes down only, without \"..\"", "up from home"},
        {"read $(HOME)", "line 1: the parameter \"HOME\" is unknown", "an unknown parameter"},
        {"read $()", "line 1: the parameter \"\" is unknown", "a parameter without a name"},
        {"read $(HOME_DIR", "line 1: a \")\" is missing", "an open parameter"},
        {"read $(HOME_DIR)x", "line 1: after a parameter comes a \"/\" or nothing",
         "it would name a neighbour of the home folder"},
        {"read /a/$(HOME_DIR)", "line 1: a parameter stands at the beginning of a path only",
         "a parameter in the middle"},
        {"read $(HOME_DIR)/$(CACHE)", "line 1: a parameter stands at the beginning of a path only",
         "two parameters"},
        {"socket", "line 1: \"\" is no family that can be allowed", "no family"},
        {"socket inet", "line 1: \"inet\" is no family that can be allowed", "a network family"},
        {"socket unix inet", "line 1: \"unix inet\" is no family that can be allowed", "two"},
        {"read /\r\n", "line 1: a control character", "line ends of another system"},
        {"read /a\0b"sv, "line 1: a control character", "a zero would cut the path short"},
        {"# \x7f", "line 1: a control character", "in a comment as well"},
        {"read /usr\n\n# x\nwrite", "line 4: the path is missing", "lines are counted from 1"},
        {"read /usr\nfoo", "line 2: the word \"foo\" is unknown", "no line feed at the end"},
    };
    for (const auto& row : rows) {
        const auto answer = parseSandboxProfile(row.text, kParameters);

        EXPECT_FALSE(answer.profile) << row.why;
        EXPECT_EQ(answer.errorText, row.error) << row.why;
    }
}

TEST(SandboxProfileTest, RefusesParametersThatAreNoPaths) {
    struct Row {
        std::vector<SandboxParameter> parameters;
        const char* error;
        const char* why;
    };
    const Row rows[] = {
        {{{"A", "/x"}, {"A", "/y"}}, "the parameter A is given twice", "which one counts?"},
        {{{"A", ""}}, "the parameter A is not an absolute path", "$(A)/etc would be /etc"},
        {{{"A", "x/y"}}, "the parameter A is not an absolute path", "relative"},
        {{{"A", std::string("/x\0y", 4)}}, "the parameter A is not an absolute path", "cut short"},
    };
    for (const auto& row : rows) {
        const auto answer = parseSandboxProfile("", row.parameters);

        EXPECT_FALSE(answer.profile) << row.why;
        EXPECT_EQ(answer.errorText, row.error) << row.why;
    }
}

}  // namespace vlm::platform
