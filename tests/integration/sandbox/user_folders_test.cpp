#include "platform/linux/user_folders.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>

#include "tests/integration/linux/temporary_folder.h"

namespace vlm::platform {

namespace {

constexpr uid_t kSomebodyElse = 65534;

mode_t modeOf(const std::filesystem::path& path) {
    struct stat status {};
    return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

class UserFoldersTest : public ::testing::Test {
protected:
    UserFoldersTest() {
        for (const auto& each : {runtime(), home(), accountHome(), outside()})
            std::filesystem::create_directories(each);
    }

    std::filesystem::path runtime() const { return _folder.path() / "runtime"; }
    std::filesystem::path home() const { return _folder.path() / "home"; }
    std::filesystem::path accountHome() const { return _folder.path() / "account"; }
    std::filesystem::path outside() const { return _folder.path() / "outside"; }

    UserPlaces places() const { return {runtime(), std::nullopt, home(), accountHome()}; }

    // Whether the folder now belongs to another user; only root can do that.
    static bool giveAway(const std::filesystem::path& path) {
        return geteuid() == 0 && lchown(path.c_str(), kSomebodyElse, kSomebodyElse) == 0;
    }

private:
    test::TemporaryFolder _folder;
};

#define GIVE_AWAY_OR_SKIP(path) \
    if (!giveAway(path)) GTEST_SKIP() << "only root can give a folder to another user"

}  // namespace

TEST_F(UserFoldersTest, AreMadeForTheUserAlone) {
    const auto temporary = userTemporaryFolder(places());
    const auto cache = userCacheFolder(places());

    EXPECT_EQ(temporary.path, runtime() / "vlm");
    EXPECT_EQ(cache.path, home() / ".cache/vlm");
    for (const auto& each : {runtime() / "vlm", home() / ".cache", home() / ".cache/vlm"})
        EXPECT_EQ(modeOf(each), 0700U) << each;
}

TEST_F(UserFoldersTest, AreTheSameTheNextTime) {
    const auto first = userCacheFolder(places());
    const auto second = userCacheFolder(places());

    EXPECT_EQ(second.path, first.path);
    EXPECT_EQ(second.errorNumber, 0);
}

TEST_F(UserFoldersTest, LieWhereTheEnvironmentWantsTheCache) {
    auto wanted = places();
    wanted.cacheHome = outside();

    EXPECT_EQ(userCacheFolder(wanted).path, outside() / "vlm");
    EXPECT_FALSE(std::filesystem::exists(home() / ".cache"));
}

TEST_F(UserFoldersTest, TheTemporaryOneLiesInTheCacheWithoutARuntimeFolder) {
    auto without = places();
    without.runtimeFolder.reset();

    EXPECT_EQ(userTemporaryFolder(without).path, home() / ".cache/vlm/tmp");
    EXPECT_EQ(modeOf(home() / ".cache/vlm/tmp"), 0700U);
}

TEST_F(UserFoldersTest, TheAccountsHomeServesWhenTheEnvironmentNamesNone) {
    auto without = places();
    without.home.reset();

    EXPECT_EQ(userCacheFolder(without).path, accountHome() / ".cache/vlm");
}

TEST_F(UserFoldersTest, AFolderThatIsNotThereIsPassedOver) {
    auto wanted = places();
    wanted.cacheHome = outside() / "missing";

    EXPECT_EQ(userCacheFolder(wanted).path, home() / ".cache/vlm");
}

TEST_F(UserFoldersTest, ALinkInThePlaceOfAPrivateFolderIsPassedOver) {
    auto wanted = places();
    wanted.cacheHome = outside();
    std::filesystem::create_directory(outside() / "real");
    chmod((outside() / "real").c_str(), 0700);
    std::filesystem::create_directory_symlink(outside() / "real", outside() / "vlm");

    EXPECT_EQ(userCacheFolder(wanted).path, home() / ".cache/vlm");
    EXPECT_TRUE(std::filesystem::is_empty(outside() / "real"));
}

TEST_F(UserFoldersTest, ASharedCacheFolderMayBeALinkToOneOfTheUsers) {
    std::filesystem::create_directory_symlink(outside(), home() / ".cache");

    EXPECT_EQ(userCacheFolder(places()).path, home() / ".cache/vlm");
    EXPECT_EQ(modeOf(outside() / "vlm"), 0700U);
}

TEST_F(UserFoldersTest, AFileInThePlaceOfAFolderIsPassedOver) {
    for (const auto& file : {home() / ".cache", accountHome() / ".cache"})
        ASSERT_EQ(mknod(file.c_str(), S_IFREG | 0600, 0), 0);

    const auto answer = userCacheFolder(places());

    EXPECT_EQ(answer.path, "");
    EXPECT_EQ(answer.errorNumber, ENOTDIR);
}

TEST_F(UserFoldersTest, AFolderThatOthersMayEnterIsPassedOver) {
    for (const mode_t mode : {0755U, 0710U, 0701U, 0770U, 0777U}) {
        std::filesystem::create_directories(home() / ".cache/vlm");
        chmod((home() / ".cache/vlm").c_str(), mode);

        EXPECT_EQ(userCacheFolder(places()).path, accountHome() / ".cache/vlm") << std::oct << mode;
    }
}

TEST_F(UserFoldersTest, ABaseThatAllMayChangeIsPassedOverUnlessTheStickyBitProtectsIt) {
    chmod(home().c_str(), 0777);
    EXPECT_EQ(userCacheFolder(places()).path, accountHome() / ".cache/vlm");

    chmod(home().c_str(), 01777);
    EXPECT_EQ(userCacheFolder(places()).path, home() / ".cache/vlm");
}

TEST_F(UserFoldersTest, AFolderOfSomebodyElseIsPassedOver) {
    std::filesystem::create_directories(home() / ".cache/vlm");
    chmod((home() / ".cache/vlm").c_str(), 0700);
    GIVE_AWAY_OR_SKIP(home() / ".cache/vlm");

    EXPECT_EQ(userCacheFolder(places()).path, accountHome() / ".cache/vlm");
}

TEST_F(UserFoldersTest, NothingIsMadeInAHomeOfSomebodyElse) {
    GIVE_AWAY_OR_SKIP(home());

    EXPECT_EQ(userCacheFolder(places()).path, accountHome() / ".cache/vlm");
    EXPECT_TRUE(std::filesystem::is_empty(home()));
}

TEST_F(UserFoldersTest, ALinkIntoTheFolderOfSomebodyElseIsPassedOver) {
    std::filesystem::create_directory_symlink(outside(), home() / ".cache");
    GIVE_AWAY_OR_SKIP(outside());

    EXPECT_EQ(userCacheFolder(places()).path, accountHome() / ".cache/vlm");
    EXPECT_TRUE(std::filesystem::is_empty(outside()));
}

TEST_F(UserFoldersTest, TheRuntimeFolderOfSomebodyElseIsPassedOver) {
    GIVE_AWAY_OR_SKIP(runtime());

    EXPECT_EQ(userTemporaryFolder(places()).path, home() / ".cache/vlm/tmp");
}

TEST_F(UserFoldersTest, TheErrorNumberSaysWhyThereIsNone) {
    struct Row {
        UserPlaces places;
        int error;
        const char* why;
    };
    chmod(home().c_str(), 0777);
    const Row rows[] = {
        {{}, ENOENT, "nothing names a place"},
        {{{}, {}, "/no/such/home", {}}, ENOENT, "the home folder is missing"},
        {{{}, {}, home(), {}}, EACCES, "everybody may change the home folder"},
        {{{}, {}, "/dev/null", {}}, ENOTDIR, "the home folder is no folder"},
    };
    for (const auto& row : rows) {
        for (const auto& answer : {userCacheFolder(row.places), userTemporaryFolder(row.places)}) {
            EXPECT_EQ(answer.path, "") << row.why;
            EXPECT_EQ(answer.errorNumber, row.error) << row.why;
        }
    }
}

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

TEST(UserPlacesTest, ComeFromTheEnvironmentAndTheAccount) {
    setenv("XDG_RUNTIME_DIR", "/r", 1);
    setenv("XDG_CACHE_HOME", "/c", 1);
    setenv("XDG_CONFIG_HOME", "/f", 1);
    setenv("HOME", "/h", 1);

    const auto places = UserPlaces::ofThisProcess();

    EXPECT_EQ(places.runtimeFolder, "/r");
    EXPECT_EQ(places.cacheHome, "/c");
    EXPECT_EQ(places.configurationHome, "/f");
    EXPECT_EQ(places.home, "/h");
    EXPECT_NE(places.accountHome, "/h");
}

TEST(UserPlacesTest, LeaveOutWhatIsUnsetEmptyOrRelative) {
    unsetenv("XDG_RUNTIME_DIR");
    setenv("XDG_CACHE_HOME", "", 1);
    setenv("XDG_CONFIG_HOME", "relative", 1);
    setenv("HOME", "relative", 1);

    const auto places = UserPlaces::ofThisProcess();

    EXPECT_EQ(places.runtimeFolder, std::nullopt);
    EXPECT_EQ(places.cacheHome, std::nullopt);
    EXPECT_EQ(places.configurationHome, std::nullopt);
    EXPECT_EQ(places.home, std::nullopt);
}

}  // namespace vlm::platform
