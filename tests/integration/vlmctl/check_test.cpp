// The check of files of every kind, by the real program.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "control_machine.h"

namespace vlm::test {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;

class ControlCheck : public ::testing::Test {
protected:
    Ended check(const std::filesystem::path& file) { return run({vlmctl, "check", file}); }

    const std::string vlmctl = std::string(VLM_BUILD_TREE) + "/bin/vlmctl";
    TemporaryFolder folder;
};

TEST_F(ControlCheck, IsContentWithAGoodFile) {
    const auto file = folder.write("a.plist", xmlList("<key>UserPairing</key><true/>\n"));

    const auto checked = check(file);

    EXPECT_EQ(checked.status, 0);
    EXPECT_EQ(checked.output, file.string() + ": XML property list, 1 key, no problems\n");
    EXPECT_EQ(checked.errors, "");
}

TEST_F(ControlCheck, TellsTheLineAndColumnOfWhatIsMalformedInXml) {
    const auto file = folder.write("a.plist", xmlList("  <key>UserPairing</wrong>\n"));

    const auto checked = check(file);

    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.output, testing::StartsWith(file.string() + ":4:"));
}

TEST_F(ControlCheck, TellsTheLineAndColumnOfWhatIsMalformedInText) {
    const auto file = folder.write("a.plist", "{\n  UserPairing = ;\n}\n");

    const auto checked = check(file);

    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.output, testing::StartsWith(file.string() + ":2:17: "));
}

TEST_F(ControlCheck, TellsOfATextThatLooksLikeASwitch) {
    const auto checked = check(folder.write("a.plist", "{ UserPairing = 1; }\n"));

    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.output, HasSubstr("\"UserPairing\" is text, and counts as absent"));
}

TEST_F(ControlCheck, WarnsWithoutFailing) {
    const auto checked = check(folder.write("a.plist", xmlList("<key>userPairing</key><true/>\n")));

    EXPECT_EQ(checked.status, 0);
    EXPECT_THAT(checked.output, HasSubstr(": warning: \"userPairing\" is no known key; did you "
                                          "mean \"UserPairing\"?\n"));
}

TEST_F(ControlCheck, KnowsTheConfigurationFileByItsName) {
    const auto list = xmlList("<key>AttributeMapping</key><dict/>\n");

    EXPECT_EQ(check(folder.write("SmartcardLogin.plist", list)).output,
              (folder.path() / "SmartcardLogin.plist").string() +
                  ": XML property list, 1 key, no problems\n");
    EXPECT_THAT(check(folder.write("org.vlm.smartcard.plist", list)).output,
                HasSubstr("warning: \"AttributeMapping\" is read from"));
}

TEST_F(ControlCheck, ReadsStandardInputToItsEnd) {
    const auto checked = run({vlmctl, "check", "-"}, {}, xmlList("<key>useLocalOd</key><date/>\n"));

    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.output, testing::StartsWith("-:"));
}

TEST_F(ControlCheck, WritesItsFindingsAsJson) {
    const auto checked =
        run({vlmctl, "check", "--json", "-"}, {}, xmlList("<key>userPairing</key><true/>\n"));

    EXPECT_EQ(checked.status, 0);
    EXPECT_EQ(checked.output, R"({
  "file": "-",
  "format": "xml",
  "ok": true,
  "keys": 1,
  "findings": [
    {
      "severity": "warning",
      "line": null,
      "column": null,
      "text": "\"userPairing\" is no known key; did you mean \"UserPairing\"?"
    }
  ]
}
)");
}

TEST_F(ControlCheck, RefusesWhatIsNoFileWithoutWaitingForIt) {
    const auto pipe = folder.path() / "pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    const std::pair<std::filesystem::path, const char*> rows[] = {
        {pipe, "it is not a regular file"},
        {"/dev/zero", "it is not a regular file"},
        {folder.path(), "it is a folder"},
        {folder.path() / "none", "No such file or directory"},
    };
    for (const auto& [file, why] : rows) {
        SCOPED_TRACE(file);

        const auto refused = check(file);

        EXPECT_EQ(refused.status, 2);
        EXPECT_EQ(refused.output, "");
        EXPECT_EQ(refused.errors,
                  "vlmctl: " + file.string() + " cannot be read: " + std::string(why) + "\n");
    }
}

TEST_F(ControlCheck, RefusesAFileThatIsTooLargeUnread) {
    const auto file = folder.write("a.plist", "bplist00");
    std::filesystem::resize_file(file, std::uintmax_t{2} << 30U);

    const auto refused = check(file);

    EXPECT_EQ(refused.status, 2);
    EXPECT_THAT(refused.errors, HasSubstr("it has more than 4194304 bytes"));
}

TEST_F(ControlCheck, FailsWhenWhatItSaysIsLost) {
    const auto file = folder.write("a.plist", xmlList(""));

    const auto lost = run({"sh", "-c", vlmctl + " check " + file.string() + " > /dev/full"});

    EXPECT_EQ(lost.status, 1);
    EXPECT_EQ(lost.errors, "vlmctl: cannot write to standard output\n");
}

}  // namespace
}  // namespace vlm::test
