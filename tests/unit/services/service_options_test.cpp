#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "services/hints/options.h"

namespace vlm::service {
namespace {

using namespace std::chrono_literals;
using testing::HasSubstr;

TEST(ServiceOptionsTest, ServeTheMachine) {
    const auto parsed = parseOptions({"--system"});

    ASSERT_TRUE(parsed.options);
    EXPECT_EQ(parsed.options->instance, Instance::System);
    EXPECT_EQ(parsed.options->database, "/var/lib/vlm/hints.sqlite3");
    EXPECT_EQ(parsed.options->pinentry, "");
    EXPECT_EQ(parsed.options->worker, "");
    EXPECT_EQ(parsed.options->moduleFolder, "");
    EXPECT_EQ(parsed.options->idleTime, 120s);
}

TEST(ServiceOptionsTest, TakeEachPathInEitherForm) {
    const auto parsed = parseOptions(
        {"--database", "/a", "--pinentry=/b", "--system", "--worker", "/c", "--modules=/d=e"});

    ASSERT_TRUE(parsed.options);
    EXPECT_EQ(parsed.options->database, "/a");
    EXPECT_EQ(parsed.options->pinentry, "/b");
    EXPECT_EQ(parsed.options->worker, "/c");
    EXPECT_EQ(parsed.options->moduleFolder, "/d=e");
}

TEST(ServiceOptionsTest, ServeOneUser) {
    const auto parsed = parseOptions({"--user", "--pinentry", "/usr/bin/pinentry-x"});

    ASSERT_TRUE(parsed.options);
    EXPECT_EQ(parsed.options->instance, Instance::User);
    EXPECT_EQ(parsed.options->pinentry, "/usr/bin/pinentry-x");
}

TEST(ServiceOptionsTest, TakeTheIdleTimeInSeconds) {
    const auto idleTime = [](const std::string& seconds) {
        const auto parsed = parseOptions({"--system", "--idle-seconds", seconds});
        return parsed.options ? parsed.options->idleTime : -1ms;
    };

    EXPECT_EQ(idleTime("30"), 30s);
    EXPECT_EQ(idleTime("0.25"), 250ms);
    EXPECT_EQ(idleTime("0"), 0s);
    EXPECT_EQ(idleTime("0.0001"), 1ms) << "short, but not \"never\"";
    EXPECT_EQ(idleTime("86400"), 24h);
}

TEST(ServiceOptionsTest, RefuseAnIdleTimeThatIsNone) {
    for (const std::string seconds :
         {"", "-1", "86401", "1e3", "2s", " 2", "2 ", "1,5", "two", "inf", "nan"}) {
        SCOPED_TRACE(seconds);

        const auto parsed = parseOptions({"--system", "--idle-seconds=" + seconds});

        EXPECT_FALSE(parsed.options);
        EXPECT_EQ(parsed.exitStatus, 64);
        EXPECT_THAT(parsed.text,
                    testing::StartsWith("vlmhintsd: --idle-seconds needs a number of seconds from "
                                        "0, which is never, to 86400."));
    }
}

struct Wrong {
    const char* why;
    std::vector<std::string> arguments;
    const char* named;
};

TEST(ServiceOptionsTest, RefuseWhatTheyDoNotUnderstand) {
    const Wrong rows[] = {
        {"nothing", {}, "--system or --user"},
        {"both", {"--system", "--user"}, "once"},
        {"twice", {"--user", "--user"}, "once"},
        {"an unknown option", {"--system", "--fast"}, "--fast"},
        {"a word", {"--system", "now"}, "now"},
        {"a path that is missing", {"--system", "--database"}, "--database"},
        {"a path that is empty", {"--system", "--database="}, "--database"},
        {"a path that is relative", {"--system", "--worker", "worker"}, "--worker"},
        {"a value where none belongs", {"--system=yes"}, "--system"},
        {"an idle time that is missing", {"--system", "--idle-seconds"}, "--idle-seconds"},
        {"an idle time of a user", {"--user", "--idle-seconds", "5"}, "--idle-seconds is for"},
        {"a database of a user", {"--user", "--database", "/a"}, "--database"},
    };
    for (const auto& [why, arguments, named] : rows) {
        SCOPED_TRACE(why);

        const auto parsed = parseOptions(arguments);

        EXPECT_FALSE(parsed.options);
        EXPECT_EQ(parsed.exitStatus, 64);
        EXPECT_THAT(parsed.text, testing::StartsWith("vlmhintsd: "));
        EXPECT_THAT(parsed.text, HasSubstr(named));
    }
}

TEST(ServiceOptionsTest, TellHelpAndVersion) {
    const auto help = parseOptions({"--help"});
    const auto version = parseOptions({"--version"});

    EXPECT_FALSE(help.options);
    EXPECT_EQ(help.exitStatus, 0);
    for (const auto* option :
         {"--system", "--user", "--database", "--pinentry", "--worker", "--modules",
          "--idle-seconds", "(default: 120)", "/var/lib/vlm/hints.sqlite3"})
        EXPECT_THAT(help.text, HasSubstr(option));
    EXPECT_EQ(version.exitStatus, 0);
    EXPECT_THAT(version.text, testing::MatchesRegex("vlmhintsd [0-9]+\\.[0-9]+\\.[0-9]+\n"));
}

}  // namespace
}  // namespace vlm::service
