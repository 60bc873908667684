#include "settings/smartcard_settings.h"

#include "settings/smartcard_settings_worker.h"
#include "settings_fixture.h"

namespace vlm {
namespace {

class SmartcardSetting : public SettingsTest {};

struct Default {
    const char* key;
    std::int32_t value;
    const char* why;
};

TEST_F(SmartcardSetting, HasItsDefaultWhenNothingIsStored) {
    const Default rows[] = {
        {"allowSmartCard", 1, "cards may be used"},
        {"UserPairing", 1, "the dialog is enabled"},
        {"oneCardPerUser", 0, "off"},
        {"checkCertificateTrust", 0, "off"},
        {"useLocalOd", 0, "off"},
        {"enforceSmartCard", 0, "off"},
        {"allowUnmappedUsers", 0, "off"},
        {"tokenRemovalAction", 0, "nothing is done"},
        {"noSuchSetting", 0, "an unknown key"},
        {"userpairing", 0, "keys are case-sensitive"},
        {"UserPairing ", 0, "keys are compared exactly"},
        {"", 0, "the empty key"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        EXPECT_EQ(VLGetSmartcardSetting(row.key), row.value);
        EXPECT_EQ(VLGetSmartcardSettingOrigin(row.key), SmartcardSettingOrigin::Default);
    }
}

TEST_F(SmartcardSetting, IsToldWithoutALineToWhoAsksAgainAndAgain) {
    EXPECT_EQ(settingNow("allowSmartCard"), 1);
    setForMachine("allowSmartCard", false);
    EXPECT_EQ(settingNow("allowSmartCard"), 0);
    force("allowSmartCard", 5);
    EXPECT_EQ(settingNow("allowSmartCard"), 5);

    EXPECT_TRUE(log().lines().empty());
}

TEST_F(SmartcardSetting, IsWhatIsSetForTheMachine) {
    setForMachine("allowSmartCard", false);

    EXPECT_EQ(VLGetSmartcardSetting("allowSmartCard"), 0);
    EXPECT_EQ(VLGetSmartcardSettingOrigin("allowSmartCard"), SmartcardSettingOrigin::Machine);
}

TEST_F(SmartcardSetting, IsWhatManagementForces) {
    force("allowSmartCard", true);
    setForMachine("allowSmartCard", false);

    EXPECT_EQ(VLGetSmartcardSetting("allowSmartCard"), 1);
    EXPECT_EQ(VLGetSmartcardSettingOrigin("allowSmartCard"), SmartcardSettingOrigin::Managed);
}

TEST_F(SmartcardSetting, IsNeverWhatTheUserWants) {
    setForUser("allowSmartCard", false);

    EXPECT_EQ(VLGetSmartcardSetting("allowSmartCard"), 1);
}

TEST_F(SmartcardSetting, IgnoresWhatManagementForcesAboutUnmappedUsers) {
    force("allowUnmappedUsers", true);
    EXPECT_EQ(VLGetSmartcardSetting("allowUnmappedUsers"), 0);

    setForMachine("allowUnmappedUsers", 5);
    EXPECT_EQ(VLGetSmartcardSetting("allowUnmappedUsers"), 5);
    EXPECT_EQ(VLGetSmartcardSettingOrigin("allowUnmappedUsers"), SmartcardSettingOrigin::Machine);
}

TEST_F(SmartcardSetting, TakesATextForNoValue) {
    setForMachine("UserPairing", "0");
    setForMachine("oneCardPerUser", "1");

    EXPECT_EQ(VLGetSmartcardSetting("UserPairing"), 1);
    EXPECT_EQ(VLGetSmartcardSetting("oneCardPerUser"), 0);
}

TEST_F(SmartcardSetting, HasItsDefaultAndNotTheMachinesValueWhenWhatIsForcedIsUnusable) {
    force("oneCardPerUser", "1");
    setForMachine("oneCardPerUser", 1);

    EXPECT_EQ(VLGetSmartcardSetting("oneCardPerUser"), 0);
    EXPECT_EQ(VLGetSmartcardSettingOrigin("oneCardPerUser"), SmartcardSettingOrigin::Default);
}

TEST_F(SmartcardSetting, IsReadFromItsOwnDomain) {
    preferences().force("oneCardPerUser", "org.vlm.other", true);
    preferences().put("oneCardPerUser", "org.vlm.other", platform::PreferencesUser::Any, true);

    EXPECT_EQ(VLGetSmartcardSetting("oneCardPerUser"), 0);
}

TEST_F(SmartcardSetting, IsReadAnewEachTime) {
    setForMachine("oneCardPerUser", 1);
    EXPECT_EQ(VLGetSmartcardSetting("oneCardPerUser"), 1);

    setForMachine("oneCardPerUser", 0);
    EXPECT_EQ(VLGetSmartcardSetting("oneCardPerUser"), 0);
}

TEST_F(SmartcardSetting, IsTheSameHoweverItsKeyIsStored) {
    setForMachine("UserPairing", 7);

    EXPECT_EQ(VLGetSmartcardSetting(String::fromUtf16(u"UserPairing")), 7);
}

TEST_F(SmartcardSetting, TellsTheLogThatItHasItsDefault) {
    VLGetSmartcardSetting("UserPairing");

    EXPECT_EQ(logged(),
              (Lines{"info: VLGetSmartcardSetting UserPairing", "info: Using system prefs",
                     "info: Using default value", "info: Returning value 1"}));
}

TEST_F(SmartcardSetting, TellsTheLogThatItIsSetForTheMachine) {
    setForMachine("oneCardPerUser", 5);

    VLGetSmartcardSetting("oneCardPerUser");

    EXPECT_EQ(logged(), (Lines{"info: VLGetSmartcardSetting oneCardPerUser",
                               "info: Using system prefs", "info: Returning value 5"}));
}

TEST_F(SmartcardSetting, TellsTheLogThatItIsForced) {
    force("oneCardPerUser", true);

    VLGetSmartcardSetting("oneCardPerUser");

    EXPECT_EQ(logged(), (Lines{"info: VLGetSmartcardSetting oneCardPerUser",
                               "info: Using MDM prefs", "info: Returning value 1"}));
}

TEST_F(SmartcardSetting, TellsTheLogThatWhatIsForcedIsUnusable) {
    force("UserPairing", platform::Bytes{1});

    VLGetSmartcardSetting("UserPairing");

    EXPECT_EQ(logged(), (Lines{"info: VLGetSmartcardSetting UserPairing", "info: Using MDM prefs",
                               "info: Using default value", "info: Returning value 1"}));
}

TEST_F(SmartcardSetting, LooksForNoForcedValueAboutUnmappedUsers) {
    force("allowUnmappedUsers", 1);

    VLGetSmartcardSetting("allowUnmappedUsers");

    EXPECT_EQ(logged(),
              (Lines{"info: VLGetSmartcardSetting allowUnmappedUsers", "info: Using system prefs",
                     "info: Using default value", "info: Returning value 0"}));
}

TEST_F(SmartcardSetting, TellsTheLogNoMoreAboutItsOriginThanAboutItsValue) {
    force("UserPairing", 1);

    VLGetSmartcardSettingOrigin("UserPairing");
    VLGetSmartcardSettingOrigin("oneCardPerUser");

    EXPECT_EQ(logged(), (Lines{"info: Using MDM prefs", "info: Using system prefs",
                               "info: Using default value"}));
}

}  // namespace
}  // namespace vlm
