#include "control_fixture.h"

namespace vlm::control {
namespace {

using testing::HasSubstr;

class SettingsCommand : public ControlTest {
protected:
    // The row of one key, without the key.
    static std::string rowOf(const std::string& key, std::vector<std::string> words) {
        words.insert(words.begin(), "settings");
        const auto run = vlmctl(words);
        const auto start = run.output.find(key);
        if (start == std::string::npos) return run.output + run.complaints;
        const auto row = run.output.substr(start, run.output.find('\n', start) - start);
        return row.substr(row.find_first_not_of(' ', key.size()));
    }
};

TEST_F(SettingsCommand, ListsEveryKnownKeyWithItsDefault) {
    const auto run = vlmctl({"settings"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output,
              "KEY                    VALUE  ORIGIN\n"
              "allowSmartCard         1      default\n"
              "UserPairing            1      default\n"
              "oneCardPerUser         0      default\n"
              "checkCertificateTrust  0      default\n"
              "useLocalOd             0      default\n"
              "enforceSmartCard       0      default\n"
              "allowUnmappedUsers     0      default\n"
              "tokenRemovalAction     0      default\n");
    EXPECT_EQ(run.complaints, "");
}

TEST_F(SettingsCommand, TellsWhereAValueComesFrom) {
    putOnMachine("oneCardPerUser", true);
    putOnMachine("allowSmartCard", false);
    manage("allowSmartCard", true);
    putOnMachine("useLocalOd", "yes");

    EXPECT_EQ(rowOf("oneCardPerUser", {}), "1      machine");
    EXPECT_EQ(rowOf("allowSmartCard", {}), "1      managed");
    EXPECT_EQ(rowOf("useLocalOd", {}), "0      default");
}

TEST_F(SettingsCommand, ShowsThatManagementDoesNotDecideAboutUnmappedUsers) {
    manage("allowUnmappedUsers", true);

    EXPECT_EQ(rowOf("allowUnmappedUsers", {}), "0      default");
}

TEST_F(SettingsCommand, LeavesTheHeadingsOutForAProgram) {
    EXPECT_THAT(vlmctl({"settings", "--no-legend"}).output,
                testing::StartsWith("allowSmartCard         1  default\n"));
}

struct UserRow {
    const char* why;
    std::int32_t enforce;
    std::int32_t unmapped;
    std::vector<platform::Bytes> pairings;
    const char* row;
};

TEST_F(SettingsCommand, SaysInWordsWhyTheRuleForOneUserIsWhatItIs) {
    const UserRow rows[] = {
        {"not enforced", 0, 1, {}, "0      machine"},
        {"no exceptions", 1, 0, {}, "1      machine; allowUnmappedUsers is off"},
        {"an exception",
         1,
         1,
         {},
         "0      machine; alice is not paired and allowUnmappedUsers is on"},
        {"no exception for who is paired", 5, 1, {{1}}, "5      machine; alice is paired"},
    };
    for (const auto& [why, enforce, unmapped, pairings, row] : rows) {
        SCOPED_TRACE(why);
        putOnMachine("enforceSmartCard", enforce);
        putOnMachine("allowUnmappedUsers", unmapped);
        answerPairings(pairings);
        service.pairings.clear();
        for (const auto& hash : pairings) service.pair("alice", hash);

        EXPECT_EQ(rowOf("enforceSmartCard", {"--user", "alice"}), row);
    }
}

TEST_F(SettingsCommand, SaysThatAUserCountsAsPairedWithoutAnAnswerOfTheService) {
    putOnMachine("enforceSmartCard", true);
    putOnMachine("allowUnmappedUsers", true);
    ipc().serve(nullptr);

    EXPECT_EQ(rowOf("enforceSmartCard", {"--user", "alice"}),
              "1      machine; the hints service gave no answer, so alice counts as paired");
}

TEST_F(SettingsCommand, ForAUserHasAHeadingOfItsOwnAndTheOriginOfTheOtherKeys) {
    EXPECT_THAT(vlmctl({"settings", "-u", "alice"}).output, HasSubstr("VALUE  WHY\n"));
    EXPECT_EQ(rowOf("UserPairing", {"--user", "alice"}), "1      default");
}

TEST_F(SettingsCommand, KnowsNothingOfAUserWhoIsNotThere) {
    const auto run = vlmctl({"settings", "--user", "carol"});

    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints, "vlmctl: there is no account \"carol\"\n");
}

TEST_F(SettingsCommand, WritesJson) {
    putOnMachine("enforceSmartCard", true);

    const auto machine = vlmctl({"settings", "--json"}).output;
    const auto user = vlmctl({"settings", "--json", "--user", "alice"}).output;

    EXPECT_THAT(machine, testing::StartsWith("{\n  \"settings\": [\n    {\n"
                                             "      \"key\": \"allowSmartCard\",\n"
                                             "      \"value\": 1,\n"
                                             "      \"origin\": \"default\"\n    },\n"));
    EXPECT_THAT(user, testing::StartsWith("{\n  \"user\": \"alice\",\n  \"settings\": [\n"));
    EXPECT_THAT(user, HasSubstr("      \"key\": \"enforceSmartCard\",\n"
                                "      \"value\": 1,\n"
                                "      \"origin\": \"machine\",\n"
                                "      \"why\": \"machine; allowUnmappedUsers is off\"\n"));
}

using GetCommand = SettingsCommand;

TEST_F(GetCommand, PrintsTheValueAndNothingElse) {
    putOnMachine("oneCardPerUser", 5);

    const auto run = vlmctl({"get", "oneCardPerUser"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "5\n");
}

TEST_F(GetCommand, AnswersForOneUserWhenToldTo) {
    putOnMachine("enforceSmartCard", true);
    putOnMachine("allowUnmappedUsers", true);

    EXPECT_EQ(vlmctl({"get", "enforceSmartCard"}).output, "1\n");
    EXPECT_EQ(vlmctl({"get", "enforceSmartCard", "--user", "alice"}).output, "0\n");
    EXPECT_EQ(vlmctl({"get", "enforceSmartCard", "--user", "carol"}).status, 1);
}

TEST_F(GetCommand, WritesJson) {
    EXPECT_EQ(vlmctl({"get", "UserPairing", "--json"}).output,
              "{\n  \"key\": \"UserPairing\",\n  \"value\": 1,\n  \"origin\": \"default\"\n}\n");
}

TEST_F(GetCommand, RefusesAnUnknownKey) {
    const auto run = vlmctl({"get", "userPairing"});

    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints,
              "vlmctl: there is no setting \"userPairing\"; did you mean \"UserPairing\"?\n");
}

}  // namespace
}  // namespace vlm::control
