#include <cerrno>
#include <cstdlib>

#include "user_folders_fixture.h"

namespace vlm::platform {

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
