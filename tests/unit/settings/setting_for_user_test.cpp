#include <filesystem>
#include <fstream>
#include <optional>

#include "fake_hints_service.h"
#include "hints/hints_client.h"
#include "settings/smartcard_settings.h"
#include "settings/smartcard_settings_worker.h"
#include "settings_fixture.h"

namespace vlm {
namespace {

using Service = fakes::FakeHintsService;

constexpr const char* kNoFile = "/dev/null/none";

class SettingForUser : public SettingsTest {
protected:
    SettingForUser() { service.plugInto(ipc()); }

    void SetUp() override {
        std::string pattern = std::filesystem::temp_directory_path() / "vlm-settings-XXXXXX";
        ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
        folder = pattern;
        file = kNoFile;
    }
    void TearDown() override { std::filesystem::remove_all(folder); }

    void enforceForMappedUsersOnly() {
        setForMachine("enforceSmartCard", 1);
        setForMachine("allowUnmappedUsers", 1);
    }

    void configure(const PropertyList& list) {
        file = folder / "SmartcardLogin.plist";
        const auto bytes = *platform::writeBinaryPropertyList(list);
        std::ofstream(file, std::ios::binary) << std::string(bytes.begin(), bytes.end());
    }

    std::int32_t enforced(const std::optional<String>& user) {
        return settingForUser("enforceSmartCard", user, file, VLIsUserBound);
    }

    int questions() { return service.requests[Service::kIsUserBound]; }

    // The lines of the settings, without what the client of the service says.
    Lines ownLines() {
        Lines lines;
        for (const auto& line : logged())
            if (line.starts_with("info: ") || line.find("configuration") != std::string::npos)
                lines.push_back(line);
        return lines;
    }

    std::filesystem::path folder;
    std::filesystem::path file;
    Service service;
};

TEST_F(SettingForUser, EnforcesACardForPairedUsersOnlyWhereOthersAreAllowed) {
    enforceForMappedUsersOnly();
    service.pair("alice", {0xA1});

    EXPECT_EQ(enforced("alice"), 1);
    EXPECT_EQ(enforced("bob"), 0);
}

TEST_F(SettingForUser, KeepsTheNumberThatIsSet) {
    setForMachine("enforceSmartCard", 5);
    setForMachine("allowUnmappedUsers", -1);
    service.pair("alice", {0xA1});

    EXPECT_EQ(enforced("alice"), 5);
}

TEST_F(SettingForUser, EnforcesACardForEverybodyWhereAttributesAreMapped) {
    enforceForMappedUsersOnly();
    const PropertyList mappings[] = {
        PropertyList::Dictionary{{"fields", PropertyList::Array{"Common Name"}}},
        PropertyList::Dictionary{}, false, "", PropertyList::Array{}};

    for (const auto& mapping : mappings) {
        SCOPED_TRACE(mapping.describe());
        configure(PropertyList::Dictionary{{"Other", 1}, {"AttributeMapping", mapping}});

        EXPECT_EQ(enforced("bob"), 1);
        EXPECT_EQ(enforced(std::nullopt), 1);
    }
    EXPECT_EQ(ipc().connections, 0) << "the service is not asked";
}

TEST_F(SettingForUser, AsksTheServiceWhereTheFileMapsNoAttributes) {
    enforceForMappedUsersOnly();
    const PropertyList files[] = {
        PropertyList::Dictionary{}, PropertyList::Dictionary{{"attributemapping", true}},
        PropertyList::Dictionary{{"Inner", PropertyList::Dictionary{{"AttributeMapping", true}}}},
        PropertyList::Array{"AttributeMapping"}, "AttributeMapping"};

    int asked = 0;
    for (const auto& list : files) {
        SCOPED_TRACE(list.describe());
        configure(list);

        EXPECT_EQ(enforced("bob"), 0);
        EXPECT_EQ(questions(), ++asked);
    }
}

TEST_F(SettingForUser, EnforcesACardForEveryUserWhereNobodyElseIsAllowed) {
    setForMachine("enforceSmartCard", 1);

    EXPECT_EQ(enforced("bob"), 1);
    EXPECT_EQ(enforced(std::nullopt), 1);

    EXPECT_EQ(questions(), 0);
    for (const auto& line : logged()) EXPECT_EQ(line.find("Failed to open"), std::string::npos);
}

TEST_F(SettingForUser, EnforcesNothingThatIsNotSet) {
    setForMachine("allowUnmappedUsers", 1);
    service.pair("alice", {0xA1});

    EXPECT_EQ(enforced("alice"), 0);

    EXPECT_EQ(questions(), 0);
    for (const auto& line : logged()) EXPECT_EQ(line.find("Failed to open"), std::string::npos);
}

TEST_F(SettingForUser, DoesNotLetManagementAllowUnmappedUsers) {
    force("enforceSmartCard", true);
    force("allowUnmappedUsers", true);

    EXPECT_EQ(enforced("bob"), 1);
}

TEST_F(SettingForUser, EnforcesNothingForAnAbsentNameWhereOthersAreAllowed) {
    enforceForMappedUsersOnly();

    EXPECT_EQ(enforced(std::nullopt), 0);

    EXPECT_EQ(questions(), 0) << "there is nobody to ask about";
}

TEST_F(SettingForUser, EnforcesACardWhileTheServiceGivesNoAnswer) {
    enforceForMappedUsersOnly();
    ipc().serve(nullptr);

    EXPECT_EQ(enforced("bob"), 1);
}

TEST_F(SettingForUser, AsksNobodyButWhomItIsTold) {
    enforceForMappedUsersOnly();
    const auto onlyBob = [](const std::optional<String>& user) { return user == String("bob"); };

    EXPECT_EQ(settingForUser("enforceSmartCard", "bob", file, onlyBob), 1);
    EXPECT_EQ(settingForUser("enforceSmartCard", "alice", file, onlyBob), 0);

    EXPECT_EQ(ipc().connections, 0);
}

TEST_F(SettingForUser, IsTheMachinesSettingForEveryOtherKey) {
    setForMachine("allowUnmappedUsers", 1);
    for (const char* key :
         {"allowSmartCard", "UserPairing", "oneCardPerUser", "enforcesmartcard"}) {
        SCOPED_TRACE(key);
        setForMachine(key, 3);

        EXPECT_EQ(settingForUser(key, "bob", file, VLIsUserBound), 3);
        EXPECT_EQ(settingForUser(key, std::nullopt, file, VLIsUserBound), 3);
    }
    EXPECT_EQ(questions(), 0);
}

TEST_F(SettingForUser, TellsTheLogWhomItIsAbout) {
    VLGetSmartcardSettingForUser("UserPairing", "alice");

    EXPECT_EQ(logged(), (Lines{"info: VLGetSmartcardSettingForUser UserPairing, alice",
                               "info: Using system prefs", "info: Using default value",
                               "info: Returning value 1"}));
}

TEST_F(SettingForUser, TellsTheLogThatNobodyWasNamedAndGoesOn) {
    VLGetSmartcardSettingForUser("UserPairing", std::nullopt);

    EXPECT_EQ(logged(), (Lines{"info: VLGetSmartcardSettingForUser UserPairing, (null)",
                               "info: No username was provided UserPairing, (null)",
                               "info: Using system prefs", "info: Using default value",
                               "info: Returning value 1"}));
}

TEST_F(SettingForUser, TellsTheLogHowItDecides) {
    force("enforceSmartCard", true);
    setForMachine("allowUnmappedUsers", 1);

    enforced("bob");

    EXPECT_EQ(ownLines(), (Lines{"info: VLGetSmartcardSettingForUser enforceSmartCard, bob",
                                 "info: Using MDM prefs", "info: Using system prefs",
                                 "debug: Failed to open configuration file (error 20)",
                                 "info: Returning value 0"}));
}

}  // namespace
}  // namespace vlm
