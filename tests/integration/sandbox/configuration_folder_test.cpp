// The folder of the user's preferences.

#include <cerrno>
#include <utility>

#include "user_folders_fixture.h"

namespace vlm::platform {

TEST_F(UserFoldersTest, TheConfigurationIsMadeForTheUserAlone) {
    const auto answer = userConfigurationFolder(places());

    EXPECT_EQ(answer.path, home() / ".config/vlm");
    EXPECT_EQ(answer.errorNumber, 0);
    for (const auto& each : {home() / ".config", home() / ".config/vlm"})
        EXPECT_EQ(modeOf(each), 0700U) << each;
    EXPECT_EQ(userConfigurationFolder(places()).path, answer.path) << "the same the next time";
}

TEST_F(UserFoldersTest, TheConfigurationLiesInTheAccountsHomeWhenTheEnvironmentNamesNone) {
    auto without = places();
    without.home.reset();

    EXPECT_EQ(userConfigurationFolder(without).path, accountHome() / ".config/vlm");
}

TEST_F(UserFoldersTest, TheConfigurationLiesWhereTheEnvironmentWantsIt) {
    auto wanted = places();
    for (const auto& folder : {outside(), outside() / "made", outside() / "with slashes//"}) {
        SCOPED_TRACE(folder);
        wanted.configurationHome = folder;

        const auto answer = userConfigurationFolder(wanted);

        EXPECT_TRUE(std::filesystem::equivalent(answer.path, folder / "vlm"));
        EXPECT_EQ(modeOf(folder / "vlm"), 0700U);
    }
    EXPECT_EQ(modeOf(outside() / "made"), 0700U);
    EXPECT_FALSE(std::filesystem::exists(home() / ".config"));
}

TEST_F(UserFoldersTest, TheConfigurationIsNowhereElseWhenItsPlaceCannotBeUsed) {
    auto wanted = places();
    const std::pair<std::filesystem::path, int> rows[] = {{outside() / "missing/too", ENOENT},
                                                          {"/dev/null", ENOTDIR},
                                                          {"/dev/null/x", ENOTDIR},
                                                          {"/no-such-folder", ENOENT}};
    for (const auto& [folder, error] : rows) {
        SCOPED_TRACE(folder);
        wanted.configurationHome = folder;

        const auto answer = userConfigurationFolder(wanted);

        EXPECT_EQ(answer.path, "");
        EXPECT_EQ(answer.errorNumber, error);
        EXPECT_FALSE(std::filesystem::exists(folder / "vlm"));
    }
    EXPECT_FALSE(std::filesystem::exists(home() / ".config"));
}

TEST_F(UserFoldersTest, TheConfigurationMayBeReadByOthersButNotChangedByAll) {
    std::filesystem::create_directories(home() / ".config/vlm");
    for (const mode_t mode : {0700U, 0755U, 0750U, 0775U}) {
        chmod((home() / ".config/vlm").c_str(), mode);
        EXPECT_EQ(userConfigurationFolder(places()).path, home() / ".config/vlm")
            << std::oct << mode;
    }

    chmod((home() / ".config/vlm").c_str(), 0777);
    EXPECT_EQ(userConfigurationFolder(places()).errorNumber, EACCES);
}

TEST_F(UserFoldersTest, TheConfigurationMayBeALinkToAFolderOfTheUsers) {
    std::filesystem::create_directory(home() / ".config");
    std::filesystem::create_directory_symlink(outside(), home() / ".config/vlm");
    EXPECT_EQ(userConfigurationFolder(places()).path, home() / ".config/vlm");

    GIVE_AWAY_OR_SKIP(outside());
    EXPECT_EQ(userConfigurationFolder(places()).errorNumber, EACCES);
}

TEST_F(UserFoldersTest, NoConfigurationIsMadeWithSomebodyElse) {
    for (const auto& each : {home(), outside()}) GIVE_AWAY_OR_SKIP(each);
    auto wanted = places();

    EXPECT_EQ(userConfigurationFolder(wanted).errorNumber, EACCES);
    for (const auto& folder : {outside(), outside() / "made"}) {
        wanted.configurationHome = folder;
        EXPECT_EQ(userConfigurationFolder(wanted).errorNumber, EACCES) << folder;
    }
    EXPECT_TRUE(std::filesystem::is_empty(home()));
    EXPECT_TRUE(std::filesystem::is_empty(outside()));
}

}  // namespace vlm::platform
