#include "tool/dialog_control.h"

#include "tool_fixture.h"

namespace vlm {
namespace {

using platform::PreferencesUser;
using platform::PropertyList;

class DialogControl : public ToolTest {
protected:
    void SetUp() override {
        ToolTest::SetUp();
        enable(1);
    }

    // The machine's switch, and the user's.
    void enable(std::int32_t value) { fakes::settings().values["UserPairing"] = value; }
    void allow(bool allowed) {
        preferences().put("UserPairing", "org.vlm.smartcard", PreferencesUser::Current, allowed);
    }
    std::optional<PropertyList> allowed() {
        return preferences().value("UserPairing", "org.vlm.smartcard", PreferencesUser::Current);
    }
};

class PairingUi : public DialogControl {};

TEST_F(PairingUi, StatusIsAlwaysPrinted) {
    for (const Texts& arguments : {Texts{"-s", "status"}, Texts{"-v", "-s", "status"}}) {
        const auto run = vlmbind(arguments);

        EXPECT_EQ(run.status, 0);
        expectPrinted(run, {"SmartCard Pairing dialog is enabled."});
        EXPECT_EQ(debugLines().back(), "exiting");
    }
}

TEST_F(PairingUi, StatusIsTheUsersChoice) {
    allow(false);
    expectPrinted(vlmbind({"-s", "status"}), {"SmartCard Pairing dialog is disabled."});

    allow(true);
    expectPrinted(vlmbind({"-s", "status"}), {"SmartCard Pairing dialog is enabled."});
}

TEST_F(PairingUi, StatusIsNotTheMachinesSwitch) {
    enable(0);

    expectPrinted(vlmbind({"-s", "status"}), {"SmartCard Pairing dialog is enabled."});
    EXPECT_TRUE(fakes::settings().asked.empty());
}

TEST_F(PairingUi, StatusChangesNothing) {
    vlmbind({"-s", "status"});

    EXPECT_EQ(allowed(), std::nullopt);
    EXPECT_TRUE(preferences().synchronised.empty());
}

TEST_F(PairingUi, IsSetInSilence) {
    for (const auto& [argument, expected] : {std::pair{"disable", false}, {"enable", true}}) {
        const auto run = vlmbind({"-s", argument});

        EXPECT_EQ(run.status, 0);
        EXPECT_EQ(run.output, "");
        EXPECT_EQ(run.complaints, "");
        EXPECT_EQ(allowed(), PropertyList(expected)) << argument;
        EXPECT_EQ(debugLines().back(), "exiting");
    }
}

TEST_F(PairingUi, SaysWhatItSetWhenVerboseWhereverThatStands) {
    expectPrinted(vlmbind({"-v", "-s", "disable"}), {"SmartCard Pairing dialog is disabled."});
    expectPrinted(vlmbind({"-s", "enable", "-v"}), {"SmartCard Pairing dialog is enabled."});
}

TEST_F(PairingUi, OfSeveralArgumentsTheLastCounts) {
    const auto run = vlmbind({"-v", "-s", "enable", "-s", "disable"});

    expectPrinted(run, {"SmartCard Pairing dialog is disabled."});
    EXPECT_EQ(preferences().synchronised.size(), 1U) << "one command a run";
}

TEST_F(PairingUi, SaysWhatItSetAndSucceedsAlsoWhenThatIsNotKept) {
    preferences().refuseWrites();

    const auto run = vlmbind({"-v", "-s", "disable"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, {"SmartCard Pairing dialog is disabled."});
    EXPECT_TRUE(noticed("set UserPairing allowed: 0, result: 0"));
}

TEST_F(PairingUi, IsNotForRootAndTheChoiceStaysAsItIs) {
    runAsRoot();
    for (const char* argument : {"status", "enable", "disable"}) {
        const auto run = vlmbind({"-v", "-s", argument});

        EXPECT_EQ(run.status, 255);
        expectPrinted(run, {"This operation must not be run with root privileges."});
    }
    EXPECT_EQ(allowed(), std::nullopt);
}

TEST_F(PairingUi, IsNotChangedByAWordThatIsNoneOfTheThree) {
    EXPECT_EQ(vlmbind({"-s", "disable", "-s", "off"}).status, 255);

    EXPECT_EQ(allowed(), std::nullopt);
}

class ForceBindUi : public DialogControl {};

TEST_F(ForceBindUi, PostsTheNotificationAndIsNoCommand) {
    const auto run = vlmbind({"-f"});

    EXPECT_EQ(run.status, 255);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(run.complaints, "");
    EXPECT_EQ(notifications().posted, Texts{"org.vlm.vlmbind.force-bind-ui"});
    EXPECT_EQ(debugLines().back(), "unknown command line argument, exiting");
}

TEST_F(ForceBindUi, PostsNothingWhereTheDialogIsDisabled) {
    enable(0);

    const auto run = vlmbind({"-f"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Pairing UI is disabled."});
    EXPECT_TRUE(notifications().posted.empty());
    EXPECT_EQ(debugLines().back(), "unknown command line argument, exiting");
}

TEST_F(ForceBindUi, AsksTheMachinesSwitchAndNotTheUsers) {
    allow(false);

    vlmbind({"-f"});

    EXPECT_EQ(fakes::settings().asked, Texts{"UserPairing"});
    EXPECT_EQ(notifications().posted.size(), 1U);
}

TEST_F(ForceBindUi, SucceedsTogetherWithACommand) {
    const auto run = vlmbind({"-f", "-s", "status"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, {"SmartCard Pairing dialog is enabled."});
    EXPECT_EQ(notifications().posted.size(), 1U);
}

TEST_F(ForceBindUi, LetsParsingGoOnWhereTheDialogIsDisabled) {
    enable(0);

    const auto run = vlmbind({"-f", "-s", "status"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, {"Pairing UI is disabled.", "SmartCard Pairing dialog is enabled."});
}

TEST_F(ForceBindUi, ActsAtOnceBeforeAnOptionBehindItIsRefused) {
    const auto run = vlmbind({"-f", "-u", ""});

    EXPECT_EQ(run.status, 255);
    EXPECT_EQ(notifications().posted.size(), 1U);
}

TEST_F(ForceBindUi, IsNotReachedBehindAnOptionThatIsRefused) {
    vlmbind({"-u", "", "-f"});

    EXPECT_TRUE(notifications().posted.empty());
}

TEST_F(ForceBindUi, PostsOnceForEachTimeItIsGiven) {
    vlmbind({"-f", "-f"});

    EXPECT_EQ(notifications().posted.size(), 2U);
}

TEST_F(ForceBindUi, IsForRootToo) {
    runAsRoot();

    vlmbind({"-f"});

    EXPECT_EQ(notifications().posted.size(), 1U);
}

TEST_F(ForceBindUi, LetsTheListingFollow) {
    insertBlue();

    const auto run = vlmbind({"-f", "-i"});

    EXPECT_EQ(run.status, 0);
    EXPECT_NE(run.output, "");
}

}  // namespace
}  // namespace vlm
