// Settings on a machine with real files: what vlmctl shows, writes and refuses to write.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "control_machine.h"

namespace vlm::test {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

constexpr const char* kMachine = "vlm/preferences/org.vlm.smartcard.plist";
constexpr const char* kManaged = "vlm/managed/org.vlm.smartcard.plist";

class ControlOfSettings : public ::testing::Test {
protected:
    void SetUp() override {
        if (const auto why = ChangedMachine::unavailable()) GTEST_SKIP() << *why;
    }

    Ended vlmctl(std::vector<std::string> arguments) {
        return machine.vlmctlWithOwnEtc(std::move(arguments));
    }
    std::string get(const std::string& key) { return vlmctl({"get", key}).output; }

    ControlMachine machine;
};

TEST_F(ControlOfSettings, SetsShowsAndUnsetsAValueOfTheMachine) {
    EXPECT_EQ(get("enforceSmartCard"), "0\n");

    const auto set = vlmctl({"set", "enforceSmartCard", "on"});

    EXPECT_EQ(set.status, 0) << set.errors;
    EXPECT_EQ(set.output, "");
    EXPECT_THAT(machine.readEtc(kMachine), HasSubstr("<key>enforceSmartCard</key>"));
    EXPECT_THAT(machine.readEtc(kMachine), HasSubstr("<true/>"));
    EXPECT_EQ(get("enforceSmartCard"), "1\n");
    EXPECT_THAT(vlmctl({"settings"}).output, HasSubstr("enforceSmartCard       1      machine\n"));

    const auto unset = vlmctl({"unset", "enforceSmartCard"});

    EXPECT_EQ(unset.status, 0) << unset.errors;
    EXPECT_THAT(machine.readEtc(kMachine), Not(HasSubstr("enforceSmartCard")));
    EXPECT_EQ(get("enforceSmartCard"), "0\n");
}

TEST_F(ControlOfSettings, WritesWhatItThenFindsNothingWrongWith) {
    vlmctl({"set", "UserPairing", "off"});

    const auto checked = vlmctl({"check", std::string("/etc/") + kMachine});

    EXPECT_EQ(checked.status, 0);
    EXPECT_EQ(checked.output,
              "/etc/vlm/preferences/org.vlm.smartcard.plist: XML property list, 1 key, no "
              "problems\n");
}

TEST_F(ControlOfSettings, ShowsAManagedValueAndNeverWritesIt) {
    machine.writeEtc(kManaged, xmlList("<key>UserPairing</key><false/>\n"));

    const auto set = vlmctl({"set", "UserPairing", "on"});
    const auto unset = vlmctl({"unset", "UserPairing"});

    for (const auto& refused : {set, unset}) {
        EXPECT_EQ(refused.status, 1);
        EXPECT_THAT(refused.errors, HasSubstr("vlmctl: UserPairing is managed"));
    }
    EXPECT_EQ(machine.readEtc(kMachine), "");
    EXPECT_THAT(vlmctl({"settings"}).output, HasSubstr("UserPairing            0      managed\n"));
}

TEST_F(ControlOfSettings, WritesTheSettingThatManagementCannotForce) {
    machine.writeEtc(kManaged, xmlList("<key>allowUnmappedUsers</key><false/>\n"));

    EXPECT_EQ(vlmctl({"set", "allowUnmappedUsers", "yes"}).status, 0);

    EXPECT_EQ(get("allowUnmappedUsers"), "1\n");
}

TEST_F(ControlOfSettings, ShowsWhatHoldsAndNotWhatAFileSays) {
    machine.writeEtc(kMachine, xmlList("<key>useLocalOd</key><string>1</string>\n"
                                       "<key>oneCardPerUser</key><integer>5</integer>\n"));
    EXPECT_THAT(vlmctl({"settings"}).output, HasSubstr("useLocalOd             0      default\n"));
    EXPECT_EQ(get("oneCardPerUser"), "5\n");

    machine.writeEtc(kMachine, "<plist><dict><key>oneCardPerUser</key>");
    EXPECT_EQ(get("oneCardPerUser"), "0\n");
}

TEST_F(ControlOfSettings, SaysWhyTheRuleHoldsForAUserWhenTheConfigurationFileMapsUsers) {
    machine.writeEtc(kMachine, xmlList("<key>enforceSmartCard</key><true/>\n"
                                       "<key>allowUnmappedUsers</key><true/>\n"));
    machine.writeEtc("SmartcardLogin.plist", xmlList("<key>AttributeMapping</key><dict/>\n"));

    EXPECT_THAT(vlmctl({"settings", "--user", "alice"}).output,
                HasSubstr("enforceSmartCard       1      machine; AttributeMapping in "
                          "/etc/SmartcardLogin.plist maps users to cards\n"));
}

TEST_F(ControlOfSettings, SaysThatAUserCountsAsPairedWithoutAService) {
    machine.writeEtc(kMachine, xmlList("<key>enforceSmartCard</key><true/>\n"
                                       "<key>allowUnmappedUsers</key><true/>\n"));

    EXPECT_THAT(vlmctl({"settings", "--user", "alice"}).output,
                HasSubstr("1      machine; the hints service gave no answer, so alice counts as "
                          "paired\n"));
}

TEST_F(ControlOfSettings, AsksTheServiceWhetherAUserIsPaired) {
    if (getuid() != 0) GTEST_SKIP() << "only root may ask the service about another account";
    machine.writeEtc(kMachine, xmlList("<key>enforceSmartCard</key><true/>\n"
                                       "<key>allowUnmappedUsers</key><true/>\n"));
    machine.machine.startService();

    EXPECT_THAT(vlmctl({"settings", "--user", "root"}).output,
                HasSubstr("enforceSmartCard       0      machine; root is not paired and "
                          "allowUnmappedUsers is on\n"));
}

TEST_F(ControlOfSettings, LetsAnOrdinaryUserLookButNotTouch) {
    if (getuid() != 0) GTEST_SKIP() << "only root can run the tool as another user";
    machine.writeEtc(kMachine, xmlList("<key>UserPairing</key><false/>\n"));
    const std::vector<std::string> asAlice{"setpriv", "--reuid=1000", "--clear-groups"};

    const auto looked = machine.vlmctlWithOwnEtc({"get", "UserPairing"}, asAlice);
    const auto touched = machine.vlmctlWithOwnEtc({"set", "UserPairing", "on"}, asAlice);

    EXPECT_EQ(looked.output, "0\n") << looked.errors;
    EXPECT_EQ(touched.status, 1);
    EXPECT_THAT(touched.errors, HasSubstr("only root may change it"));
    EXPECT_EQ(get("UserPairing"), "0\n");
}

TEST_F(ControlOfSettings, SaysWhenTheRecordCannotBeWritten) {
    machine.writeEtc("vlm", "a file where the folder belongs");

    const auto set = vlmctl({"set", "UserPairing", "off"});

    EXPECT_EQ(set.status, 1);
    EXPECT_THAT(set.errors, HasSubstr("vlmctl: UserPairing could not be written"));
}

}  // namespace
}  // namespace vlm::test
