// What an administrator sets for the machine, and how pairing and login go by it.

#include <gtest/gtest.h>
#include <unistd.h>

#include "machine.h"
#include "tests/integration/settings/machine_settings.h"

namespace vlm::test {

namespace {

class Settings : public ::testing::Test {
protected:
    void SetUp() override {
        if (getuid() != 0) GTEST_SKIP() << "pairing needs root";
        if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
        machine.cards.add("Card", {identity("p256", "Alice")});
        machine.startService();
        const auto listing = machine.vlmbind({"-i"}).output;
        ASSERT_NE(listing.find('\t'), std::string::npos) << listing;
        hash = listing.substr(listing.find('\t') - 64, 64);
    }

    Ended onThatMachine(const std::vector<std::string>& program) {
        return machine.run(settings.commandLine(program));
    }
    Ended pair(const std::string& user) {
        return onThatMachine({machine.tool(), "-p", "-u", user, "-h", hash});
    }

    // What a login program is told about the user.
    std::string enforcedFor(const std::string& user) {
        const auto output = onThatMachine({SETTINGS_PROBE, "enforceSmartCard", user}).output;
        return output.substr(0, output.find(' '));
    }

    Machine machine;
    MachineSettings settings;
    std::string hash;
};

TEST_F(Settings, OneCardPerUserRefusesASecondPairingAndNoFirstOne) {
    settings.set({{"oneCardPerUser", true}});
    EXPECT_EQ(pair("root").status, 0);

    const auto refused = pair("root");

    EXPECT_EQ(refused.status, 255);
    EXPECT_EQ(refused.output, "Cannot pair user who is already paired\n");
}

TEST_F(Settings, OneCardPerUserIsOverruledByManagement) {
    settings.set({{"oneCardPerUser", true}});
    settings.force({{"oneCardPerUser", false}});
    ASSERT_EQ(pair("root").status, 0);

    EXPECT_NE(pair("root").output, "Cannot pair user who is already paired\n");
}

TEST_F(Settings, ACardIsEnforcedForPairedUsersWhereOthersAreAllowed) {
    settings.set({{"enforceSmartCard", true}, {"allowUnmappedUsers", true}});
    EXPECT_EQ(enforcedFor("root"), "0");

    ASSERT_EQ(pair("root").status, 0);

    EXPECT_EQ(enforcedFor("root"), "1");
    EXPECT_EQ(enforcedFor("nobody"), "0");
}

TEST_F(Settings, ACardIsEnforcedForEverybodyWhereNoOthersAreAllowed) {
    settings.set({{"enforceSmartCard", true}});

    EXPECT_EQ(enforcedFor("root"), "1");
    EXPECT_EQ(enforcedFor("nobody"), "1");
}

}  // namespace

}  // namespace vlm::test
