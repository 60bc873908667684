#include "control_fixture.h"

namespace vlm::control {
namespace {

using testing::HasSubstr;

class SetCommand : public ControlTest {
protected:
    void SetUp() override {
        ControlTest::SetUp();
        runAsRoot();
    }

    void expectRefused(const Run& run, const std::string& why) {
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.output, "");
        EXPECT_THAT(run.complaints, HasSubstr(why));
        EXPECT_TRUE(preferences().synchronised.empty());
    }
};

struct Row {
    const char* word;
    bool value;
};

TEST_F(SetCommand, StoresEveryWordForASwitchAsABoolean) {
    const Row rows[] = {{"true", true}, {"yes", true}, {"on", true},     {"1", true},
                        {"ON", true},   {"Yes", true}, {"false", false}, {"no", false},
                        {"off", false}, {"0", false},  {"Off", false}};
    for (const auto& [word, value] : rows) {
        SCOPED_TRACE(word);

        const auto run = vlmctl({"set", "oneCardPerUser", word});

        EXPECT_EQ(run.status, 0) << run.complaints;
        EXPECT_EQ(run.output, "");
        EXPECT_EQ(onMachine("oneCardPerUser"), PropertyList(value));
    }
}

TEST_F(SetCommand, WritesTheMachinesRecordToTheDisk) {
    vlmctl({"set", "UserPairing", "off"});

    ASSERT_EQ(preferences().synchronised.size(), 1U);
    EXPECT_EQ(preferences().synchronised[0], (std::pair(std::string(kSmartcardDomain), User::Any)));
    EXPECT_EQ(preferences().value("UserPairing", kSmartcardDomain, User::Current), std::nullopt);
}

TEST_F(SetCommand, RefusesWordsThatAreNoSwitch) {
    for (const char* word : {"5", "maybe", "", "2", "truee", "on "}) {
        SCOPED_TRACE(word);
        expectRefused(vlmctl({"set", "UserPairing", word}), "UserPairing is on or off");
    }
}

TEST_F(SetCommand, StoresAChoiceAsItsNumber) {
    const std::pair<const char*, int> rows[] = {{"none", 0}, {"lock", 1}, {"logout", 2}, {"0", 0},
                                                {"1", 1},    {"2", 2},    {"Lock", 1}};
    for (const auto& [word, number] : rows) {
        SCOPED_TRACE(word);

        const auto run = vlmctl({"set", "tokenRemovalAction", word});

        EXPECT_EQ(run.status, 0) << run.complaints;
        EXPECT_EQ(onMachine("tokenRemovalAction"), PropertyList(number));
    }
}

TEST_F(SetCommand, RefusesWordsThatAreNoChoice) {
    for (const char* word : {"on", "off", "3", "1.0", "", "log out", "true"}) {
        SCOPED_TRACE(word);
        expectRefused(vlmctl({"set", "tokenRemovalAction", word}),
                      "tokenRemovalAction is one of none, lock, logout");
    }
}

TEST_F(SetCommand, RefusesAKeyThatNobodyReads) {
    expectRefused(vlmctl({"set", "userPairing", "on"}), "did you mean \"UserPairing\"?");
    expectRefused(vlmctl({"set", "AttributeMapping", "on"}), "there is no setting");
    expectRefused(vlmctl({"unset", "userPairing"}), "did you mean \"UserPairing\"?");
}

TEST_F(SetCommand, IsForRootOnly) {
    process().runAs(1000, "alice");

    expectRefused(vlmctl({"set", "UserPairing", "on"}), "only root may change it");
    expectRefused(vlmctl({"unset", "UserPairing"}), "only root may change it");
}

TEST_F(SetCommand, NeverWritesAManagedKey) {
    manage("UserPairing", false);
    putOnMachine("UserPairing", true);

    expectRefused(vlmctl({"set", "UserPairing", "off"}), "UserPairing is managed");
    expectRefused(vlmctl({"unset", "UserPairing"}), "UserPairing is managed");
    EXPECT_EQ(onMachine("UserPairing"), PropertyList(true));
}

TEST_F(SetCommand, WritesTheKeyThatDoesNotObeyManagementAlsoWhenItIsForced) {
    manage("allowUnmappedUsers", false);

    const auto run = vlmctl({"set", "allowUnmappedUsers", "on"});

    EXPECT_EQ(run.status, 0) << run.complaints;
    EXPECT_EQ(vlmctl({"get", "allowUnmappedUsers"}).output, "1\n");
}

TEST_F(SetCommand, SaysWhenNothingCouldBeWritten) {
    preferences().refuseWrites();

    const auto run = vlmctl({"set", "UserPairing", "off", "--json"});

    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output, "");
    EXPECT_THAT(run.complaints, HasSubstr("UserPairing could not be written"));
}

TEST_F(SetCommand, TellsWhatHoldsNowAsJson) {
    EXPECT_EQ(vlmctl({"set", "UserPairing", "off", "--json"}).output,
              "{\n  \"key\": \"UserPairing\",\n  \"value\": 0,\n  \"origin\": \"machine\"\n}\n");
    EXPECT_EQ(vlmctl({"unset", "UserPairing", "--json"}).output,
              "{\n  \"key\": \"UserPairing\",\n  \"value\": 1,\n  \"origin\": \"default\"\n}\n");
}

using UnsetCommand = SetCommand;

TEST_F(UnsetCommand, BringsTheDefaultBack) {
    putOnMachine("UserPairing", false);

    const auto run = vlmctl({"unset", "UserPairing"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(onMachine("UserPairing"), std::nullopt);
}

TEST_F(UnsetCommand, IsContentWhenThereIsNothingToRemove) {
    EXPECT_EQ(vlmctl({"unset", "UserPairing"}).status, 0);
}

}  // namespace
}  // namespace vlm::control
