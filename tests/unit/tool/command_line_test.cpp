#include "tool/command_line.h"

#include <streambuf>

#include "tool_fixture.h"

namespace vlm {
namespace {

class CommandLineTest : public ToolTest {
protected:
    bool nothingSent() const { return service.requests.empty(); }
};

TEST_F(CommandLineTest, SaysFirstThatItUsesTheArguments) {
    vlmbind({"-v"});

    EXPECT_EQ(debugLines().front(), "using command line arguments");
}

struct Refusal {
    std::vector<std::string> arguments;
    const char* line;
    bool asRoot;
    const char* why;
};

TEST_F(CommandLineTest, RefusesWithALineAndTheFailureStatus) {
    constexpr const char* kUser = "Invalid user name specified.";
    constexpr const char* kHash = "Invalid public key hash specified.";
    constexpr const char* kArgument = "Invalid option argument specified.";
    constexpr const char* kRoot = "This operation requires root privileges.";
    constexpr const char* kNoRoot = "This operation must not be run with root privileges.";
    const Refusal rows[] = {
        {{"-u", ""}, kUser, false, "an empty user name"},
        {{"-u", "-alice"}, kUser, false, "a user name that begins with a dash"},
        {{"-u", "-p"}, kUser, true, "-u takes the option behind it for the user name"},
        {{"-u", "alice", "-u", ""}, kUser, false, "a second -u fails after a valid first one"},
        {{"-u", "ali\xFF"}, kUser, false, "bytes that are no text"},
        {{"-h", ""}, kHash, false, "an empty hash"},
        {{"-h", "A"}, kHash, false, "a hash that decodes to no bytes"},
        {{"-h", "   "}, kHash, false, "a hash of spaces"},
        {{"-h", "AB\xFF"}, kHash, false, "a hash that is no text"},
        {{"-s", "on"}, kArgument, false, "none of the three words"},
        {{"-s", ""}, kArgument, false, "an empty word"},
        {{"-s", "Status"}, kArgument, false, "words are compared exactly"},
        {{"-p"}, kRoot, false, "-p while not root"},
        {{"-s", "status"}, kNoRoot, true, "-s while root"},
        {{"-s", "on"}, kNoRoot, true, "-s while root, before its argument is looked at"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        process().runAs(row.asRoot ? 0 : 1000, row.asRoot ? "root" : "alice");
        const auto run = vlmbind(row.arguments);

        EXPECT_EQ(run.status, 255);
        expectPrinted(run, {row.line});
        EXPECT_FALSE(debugged("exiting"));
        EXPECT_TRUE(nothingSent());
    }
}

TEST_F(CommandLineTest, TakesTheOptionBehindDashUForTheUserNameAndRefusesIt) {
    runAsRoot();

    const auto run = vlmbind({"-u", "-p"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Invalid user name specified."});
    EXPECT_TRUE(nothingSent());
}

TEST_F(CommandLineTest, RunsNothingElseAfterAHashThatCannotBeDecoded) {
    runAsRoot();

    const auto run = vlmbind({"-p", "-u", "alice", "-h", "B", "-i"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Invalid public key hash specified."});
    EXPECT_TRUE(nothingSent());
}

TEST_F(CommandLineTest, FailsAtDashPBeforeTheHashIsParsedWhenNotRoot) {
    const auto run = vlmbind({"-p", "-h", "A"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"This operation requires root privileges."});
}

TEST_F(CommandLineTest, RefusesToEnableTheDialogAsRootAndLeavesThePreferenceUntouched) {
    runAsRoot();

    const auto run = vlmbind({"-s", "enable"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"This operation must not be run with root privileges."});
    EXPECT_TRUE(preferences().synchronised.empty()) << "the preference was not even reached for";
}

TEST_F(CommandLineTest, LogsEachArgumentItTakes) {
    vlmbind({"-u", "alice", "-h", "b1 c2", "-s", "disable"});

    EXPECT_TRUE(debugged("entered command line user: alice"));
    EXPECT_TRUE(debugged("entered command line pubkey hash: B1C2"));
    EXPECT_TRUE(debugged("entered command line pairing ui: disable"));
}

TEST_F(CommandLineTest, LogsNoArgumentItRefuses) {
    vlmbind({"-u", "-alice"});
    vlmbind({"-h", "A"});
    vlmbind({"-s", "on"});

    for (const auto& line : debugLines())
        EXPECT_EQ(line.find("entered command line"), std::string::npos) << line;
}

TEST_F(CommandLineTest, ALaterOccurrenceReplacesTheEarlierValue) {
    service.pair("bob", blueSigning);

    const auto run = vlmbind({"-r", "-u", "alice", "-h", "B2", "-u", "bob", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    EXPECT_TRUE(service.pairings.empty());
}

struct Silent {
    std::vector<std::string> arguments;
    const char* why;
};

TEST_F(CommandLineTest, WithoutACommandPrintsNothingAndFails) {
    runAsRoot();
    const Silent rows[] = {
        {{"-v"}, "-v alone"},
        {{"status"}, "no option at all"},
        {{"status", "-i"}, "options behind the first argument that is none are not looked at"},
        {{"-v", "status", "-i"}, "likewise after an option"},
        {{"--", "-i"}, "two dashes"},
        {{"-"}, "a dash"},
        {{""}, "an empty argument"},
        {{"-u", "alice", "-h", "B1"}, "values and nothing to do with them"},
        {{"-x"}, "an option that there is not"},
        {{"-u"}, "an option without its argument"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        const auto run = vlmbind(row.arguments);

        EXPECT_EQ(run.status, 255);
        EXPECT_EQ(run.output, "");
        EXPECT_EQ(debugLines().back(), "unknown command line argument, exiting");
        EXPECT_TRUE(nothingSent());
    }
}

TEST_F(CommandLineTest, GoesOnBehindAnOptionThatTheParserComplainedAbout) {
    const auto run = vlmbind({"-x", "-i"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.parserComplaints, "vlmbind: invalid option -- 'x'\n");
    EXPECT_EQ(service.requests[Service::kCopyAvailableTokensInfo], 1);
}

TEST_F(CommandLineTest, PairsAndIgnoresTheRequestToUnpair) {
    runAsRoot();
    insertBlue();

    const auto run = vlmbind({"-p", "-r", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(service.requests[Service::kBindUser], 1);
    EXPECT_EQ(service.requests[Service::kUnbindUser], 0);
}

TEST_F(CommandLineTest, UnpairsAndIgnoresDashSAfterItsChecks) {
    service.pair("alice", blueSigning);

    const auto run = vlmbind({"-r", "-s", "status", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints, "");
    EXPECT_TRUE(service.pairings.empty());
}

TEST_F(CommandLineTest, UnpairsNothingWhenTheChecksOfDashSFail) {
    service.pair("alice", blueSigning);

    const auto run = vlmbind({"-r", "-u", "alice", "-h", "B1", "-s", "on"});

    EXPECT_EQ(run.status, 255);
    EXPECT_EQ(service.pairings.size(), 1U);
}

TEST_F(CommandLineTest, ListsAndNeverPairsWhenDashIComesFirst) {
    insertBlue();

    const auto run = vlmbind({"-i", "-p"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output.find("root privileges"), std::string::npos);
    EXPECT_EQ(run.output.find("SmartCard: Blue Card\n"), 0U);
    EXPECT_EQ(service.requests[Service::kBindUser], 0);
}

TEST_F(CommandLineTest, ConsumesTheOptionRightAfterDashIWithoutEffect) {
    const auto run = vlmbind({"-i", "-u", "", "-x"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.parserComplaints, "");
    EXPECT_EQ(vlmbind({"-i", "-x"}).parserComplaints, "vlmbind: invalid option -- 'x'\n");
}

TEST_F(CommandLineTest, ListsAtOnceAndActsOnNoOptionBehind) {
    const auto run = vlmbind({"-i", "-v", "-p", "-u", ""});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
}

TEST_F(CommandLineTest, ListsNothingAfterARefusal) {
    EXPECT_EQ(vlmbind({"-u", "", "-i"}).status, 255);

    EXPECT_TRUE(nothingSent());
}

TEST_F(CommandLineTest, SaysThatItExitsJustBeforeASuccessfulEnd) {
    EXPECT_EQ(vlmbind({"-i"}).status, 0);

    EXPECT_EQ(debugLines().back(), "exiting");
}

TEST_F(CommandLineTest, FailsWithoutSayingThatItExitsWhenThereIsNothingToList) {
    ipc().serve(nullptr);

    EXPECT_EQ(vlmbind({"-i"}).status, 255);

    EXPECT_FALSE(debugged("exiting"));
}

// As standard output on a full disk: everything is taken, and nothing gets out.
class FullDisk : public std::streambuf {
    int_type overflow(int_type character) override { return traits_type::not_eof(character); }
    int sync() override { return -1; }
};

TEST_F(CommandLineTest, FailsWhenItsOutputIsLost) {
    insertBlue();
    FullDisk disk;
    std::ostream output(&disk);
    std::ostringstream complaints;
    Console console(output, complaints);
    fakes::Arguments arguments({"-i"});

    EXPECT_EQ(runCommandLine(arguments.count(), arguments.values(), console), 255);

    EXPECT_TRUE(complained("Cannot write to standard output."));
    EXPECT_FALSE(debugged("exiting"));
}

}  // namespace
}  // namespace vlm
