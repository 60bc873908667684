// libvlm on real records.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "machine_settings.h"

namespace vlm::test {

namespace {

class StoredSettings : public ::testing::Test {
protected:
    void SetUp() override {
        if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
    }

    Child::Options options() const {
        Child::Options options;
        options.environment = {{"VLM_LOG_TARGET", log},
                               {"VLM_LOG_LEVEL", std::nullopt},
                               {"XDG_CONFIG_HOME", configuration.path()}};
        return options;
    }

    // Value and origin.
    std::string setting(const std::string& key) const {
        const auto output = run(machine.commandLine({SETTINGS_PROBE, key}), options()).output;
        return output.substr(0, output.find(' ', output.find(' ') + 1));
    }

    MachineSettings machine;
    TemporaryFolder configuration;
    std::string log = "none";
};

TEST_F(StoredSettings, HaveTheirDefaultsOnAMachineThatHasNone) {
    EXPECT_EQ(setting("allowSmartCard"), "1 default");
    EXPECT_EQ(setting("UserPairing"), "1 default");
    EXPECT_EQ(setting("oneCardPerUser"), "0 default");
    EXPECT_EQ(setting("enforceSmartCard"), "0 default");
}

TEST_F(StoredSettings, ComeFromTheMachinesRecordUnlessManagementForcesThem) {
    machine.set({{"oneCardPerUser", 5}, {"UserPairing", false}});
    machine.force({{"UserPairing", true}});

    EXPECT_EQ(setting("oneCardPerUser"), "5 machine");
    EXPECT_EQ(setting("UserPairing"), "1 managed");
}

TEST_F(StoredSettings, AreToldToTheLog) {
    machine.force({{"UserPairing", "text"}});
    log = "stderr";

    const auto ended = run(machine.commandLine({SETTINGS_PROBE, "UserPairing"}), options());

    EXPECT_THAT(ended.errors, ::testing::StartsWith("info ZEM: VLGetSmartcardSetting UserPairing\n"
                                                    "info ZEM: Using MDM prefs\n"
                                                    "info ZEM: Using default value\n"
                                                    "info ZEM: Returning value 1\n"));
}

TEST_F(StoredSettings, DecideAsTheRulesSayInEveryCombination) {
    const auto ended = run(machine.commandLine({SETTINGS_TABLE}), options());

    EXPECT_EQ(ended.output, "6561 tried, 0 wrong\n");
    EXPECT_EQ(ended.status, 0) << ended.errors;
}

}  // namespace

}  // namespace vlm::test
