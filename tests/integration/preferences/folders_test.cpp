// Where preferences lie, and which folders are written in.

#include <gtest/gtest.h>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "platform/linux/file_preferences.h"
#include "platform/linux/preferences_folders.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

using platform::hostIdentifier;
using platform::PreferencesFolders;

constexpr uid_t kSomebodyElse = 65534;

class PreferencesFoldersTest : public ::testing::Test {
protected:
    // The user's folder in an environment, up to the host's name.
    static std::string usersFolder(const char* configHome, const char* home) {
        set("XDG_CONFIG_HOME", configHome);
        set("HOME", home);
        const auto folders = PreferencesFolders::ofThisMachine();
        return folders.currentUser ? Path(folders.currentUser->path()).parent_path() : "none";
    }

    bool writes(platform::PreferencesFolders folders, User user = User::Current) {
        platform::FilePreferences preferences(std::move(folders));
        preferences.setValue("key", 1, kDomain, user);
        return preferences.synchronise(kDomain, user);
    }

    TestFolders& world() { return _world; }
    Path home() { return _world.folders().currentUser->base; }

private:
    static void set(const char* name, const char* value) {
        value ? ::setenv(name, value, 1) : ::unsetenv(name);
    }

    CapturedLog _log;
    TestFolders _world;
};

TEST_F(PreferencesFoldersTest, TheMachinesLieInEtcWhateverTheEnvironmentSays) {
    usersFolder("/elsewhere", "/elsewhere");
    const auto folders = PreferencesFolders::ofThisMachine();

    EXPECT_EQ(folders.managed.path(), "/etc/vlm/managed");
    EXPECT_EQ(folders.anyUser.path(), "/etc/vlm/preferences");
    EXPECT_EQ(folders.managed.owner, 0U);
    EXPECT_EQ(folders.anyUser.owner, 0U);
}

TEST_F(PreferencesFoldersTest, TheUsersLiesWhereTheEnvironmentWantsConfigurations) {
    const passwd* account = ::getpwuid(::geteuid());
    const std::string accountHome = account ? account->pw_dir : "";
    const struct {
        const char* configHome;
        const char* home;
        std::string folder;
        const char* why;
    } rows[] = {
        {"/config", "/home/alice", "/config/vlm/hosts", "the variable decides"},
        {"/config//", "/home/alice", "/config/vlm/hosts", "slashes at its end say nothing"},
        {nullptr, "/home/alice", "/home/alice/.config/vlm/hosts", "it is not set"},
        {"", "/home/alice", "/home/alice/.config/vlm/hosts", "empty is as if not set"},
        {"config", "/home/alice", "/home/alice/.config/vlm/hosts", "a relative path is ignored"},
        {nullptr, nullptr, accountHome + "/.config/vlm/hosts", "the account has a home"},
        {nullptr, "alice", accountHome + "/.config/vlm/hosts", "a relative home is none"},
    };

    for (const auto& row : rows)
        EXPECT_EQ(usersFolder(row.configHome, row.home), row.folder) << row.why;
}

TEST_F(PreferencesFoldersTest, TheHostIsKnownByItsIdElseByItsName) {
    const std::string id = "0123456789abcdef0123456789abcdef";
    const struct {
        std::string machineId, hostName, identifier;
        const char* why;
    } rows[] = {
        {id, "box", id, "the id outlives a change of name"},
        {"", "box", "box", "no id"},
        {"uninitialized", "box.example.org", "box.example.org", "an image before its first start"},
        {"../../0123456789abcdef0123456789", "box", "box", "an id of the right length is no path"},
        {"", "../box", "_._box", "a name that would lead out of the folder"},
        {"", "", "localhost", "a machine without a name"},
    };

    for (const auto& row : rows)
        EXPECT_EQ(hostIdentifier(row.machineId, row.hostName), row.identifier) << row.why;
}

TEST_F(PreferencesFoldersTest, AMissingConfigurationFolderIsMadeForTheUserAlone) {
    auto folders = world().folders();
    folders.currentUser->base = home() / ".config";

    EXPECT_TRUE(writes(folders));

    struct stat status {};
    ASSERT_EQ(::stat((home() / ".config").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0700U);
}

TEST_F(PreferencesFoldersTest, TheConfigurationFolderMayBeALinkOursMayNot) {
    std::filesystem::create_directory(home() / "disk");
    std::filesystem::create_directory_symlink(home() / "disk", home() / ".config");
    auto folders = world().folders();
    folders.currentUser->base = home() / ".config";
    EXPECT_TRUE(writes(folders));
    EXPECT_TRUE(std::filesystem::exists(home() / "disk/vlm/hosts/here"));

    std::filesystem::rename(home() / "disk/vlm", home() / "moved");
    std::filesystem::create_directory_symlink(home() / "moved", home() / "disk/vlm");
    EXPECT_FALSE(writes(folders));
}

TEST_F(PreferencesFoldersTest, AFolderThatOthersMayWriteIsNotWrittenIn) {
    ASSERT_TRUE(writes(world().folders()));
    for (auto folder = world().record(User::Current).parent_path(); folder != home().parent_path();
         folder = folder.parent_path()) {
        ::chmod(folder.c_str(), 0777);
        EXPECT_FALSE(writes(world().folders())) << folder;
        ::chmod(folder.c_str(), 0700);
        EXPECT_TRUE(writes(world().folders())) << folder;
    }
}

TEST_F(PreferencesFoldersTest, RootWritesNothingInTheFoldersOfAnotherUser) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can give a folder to another user";
    ASSERT_EQ(::chown(home().c_str(), kSomebodyElse, kSomebodyElse), 0);

    EXPECT_FALSE(writes(world().folders()));
    EXPECT_TRUE(std::filesystem::is_empty(home()));

    auto below = world().folders();
    below.currentUser->base = home() / ".config";
    EXPECT_FALSE(writes(below));
    EXPECT_TRUE(std::filesystem::is_empty(home()));
}

}  // namespace

}  // namespace vlm::test
