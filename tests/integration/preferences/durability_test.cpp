// What a write leaves on the disk, and what one that fails leaves as it was.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <string>

#include "platform/linux/file_preferences.h"
#include "platform/linux/landlock_ruleset.h"
#include "platform/linux/seccomp_filter.h"
#include "tests/integration/preferences/forked.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

using platform::FilePreferences;
using ::testing::HasSubstr;

constexpr uid_t kOrdinaryUser = 65534;

mode_t modeOf(const Path& path) {
    struct stat status {};
    return ::lstat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

class PreferencesDurabilityTest : public ::testing::Test {
protected:
    TestFolders& world() { return _world; }
    CapturedLog& log() { return _log; }
    Path file(User user = User::Any) const { return _world.record(user); }

    // Sets the key and synchronises, with a store of its own.
    bool set(const std::string& key, const List& value, User user = User::Any) {
        FilePreferences preferences(_world.folders());
        preferences.setValue(key, value, kDomain, user);
        return preferences.synchronise(kDomain, user);
    }

    static std::vector<std::string> namesIn(const Path& folder) {
        std::vector<std::string> names;
        for (const auto& each : std::filesystem::directory_iterator(folder))
            names.push_back(each.path().filename());
        return names;
    }

private:
    CapturedLog _log;
    TestFolders _world;
};

TEST_F(PreferencesDurabilityTest, UnknownKeysTheirTypesAndTheirOrderSurvive) {
    TestFolders::write(
        file(), List::Dictionary{{"zebra", List::Array{1, "two", List::Dictionary{{"x", 0.5}}}},
                                 {"known", false},
                                 {"count", std::uint64_t{0xFFFFFFFFFFFFFFFFU}},
                                 {"gone", 1},
                                 {"blob", platform::Bytes{0, 1, 2}},
                                 {"apple", List::Date{86400}}});
    FilePreferences preferences(world().folders());

    preferences.setValue("new", "last", kDomain, User::Any);
    preferences.setValue("known", true, kDomain, User::Any);
    preferences.setValue("gone", std::nullopt, kDomain, User::Any);
    ASSERT_TRUE(preferences.synchronise(kDomain, User::Any));

    EXPECT_EQ(TestFolders::read(file()),
              List(List::Dictionary{{"zebra", List::Array{1, "two", List::Dictionary{{"x", 0.5}}}},
                                    {"known", true},
                                    {"count", std::uint64_t{0xFFFFFFFFFFFFFFFFU}},
                                    {"blob", platform::Bytes{0, 1, 2}},
                                    {"apple", List::Date{86400}},
                                    {"new", "last"}}));
}

TEST_F(PreferencesDurabilityTest, IsXmlForPeopleAndBinaryWhereXmlCannotHoldAValue) {
    ASSERT_TRUE(set("key", "text"));
    EXPECT_THAT(TestFolders::bytesOf(file()), ::testing::StartsWith("<?xml"));

    ASSERT_TRUE(set("other", "a\x01 control character"));
    EXPECT_THAT(TestFolders::bytesOf(file()), ::testing::StartsWith("bplist00"));
    EXPECT_EQ(TestFolders::read(file()),
              List(List::Dictionary{{"key", "text"}, {"other", "a\x01 control character"}}));
}

TEST_F(PreferencesDurabilityTest, TheMachinesIsForAllToReadAndTheUsersForTheUserWhateverTheMask) {
    for (const mode_t mask : {0022U, 0077U, 0000U}) {
        std::filesystem::remove_all(Path(world().folders().anyUser.base) / "vlm");
        std::filesystem::remove_all(Path(world().folders().currentUser->base) / "vlm");
        const mode_t before = ::umask(mask);

        EXPECT_TRUE(set("key", 1, User::Any));
        EXPECT_TRUE(set("key", 1, User::Current));

        ::umask(before);
        EXPECT_EQ(modeOf(file()), 0644U) << mask;
        EXPECT_EQ(modeOf(file().parent_path()), 0755U) << mask;
        EXPECT_EQ(modeOf(file().parent_path().parent_path()), 0755U) << mask;
        EXPECT_EQ(modeOf(file(User::Current)), 0600U) << mask;
        for (auto folder = file(User::Current).parent_path();
             folder != world().folders().currentUser->base; folder = folder.parent_path())
            EXPECT_EQ(modeOf(folder), 0700U) << folder << mask;
    }
}

TEST_F(PreferencesDurabilityTest, LeavesTheRecordAndItsLockAndNothingElse) {
    ASSERT_TRUE(set("key", 1));
    ASSERT_TRUE(set("key", 2));

    EXPECT_THAT(
        namesIn(file().parent_path()),
        ::testing::UnorderedElementsAre("org.example.test.plist", ".org.example.test.plist.lock"));
}

TEST_F(PreferencesDurabilityTest, NothingIsWrittenWhenNothingWasSet) {
    FilePreferences preferences(world().folders());

    EXPECT_TRUE(preferences.synchronise(kDomain, User::Any));
    EXPECT_TRUE(preferences.synchronise(kDomain, User::Current));

    EXPECT_FALSE(std::filesystem::exists(file().parent_path()));
    EXPECT_FALSE(std::filesystem::exists(file(User::Current).parent_path()));
}

TEST_F(PreferencesDurabilityTest, ALinkIsReplacedAndWhatItPointsToLeftAlone) {
    const auto elsewhere = world().managed("elsewhere");
    TestFolders::write(elsewhere, List::Dictionary{{"old", 1}});
    const auto before = TestFolders::bytesOf(elsewhere);
    std::filesystem::create_directories(file().parent_path());
    std::filesystem::create_symlink(elsewhere, file());

    ASSERT_TRUE(set("new", 2));

    EXPECT_FALSE(std::filesystem::is_symlink(file()));
    EXPECT_EQ(TestFolders::read(file()), List(List::Dictionary{{"old", 1}, {"new", 2}}));
    EXPECT_EQ(TestFolders::bytesOf(elsewhere), before);
}

TEST_F(PreferencesDurabilityTest, LinksInThePlaceOfTheStoresOwnFilesAreNotFollowed) {
    const auto victim = world().managed("victim");
    TestFolders::write(victim, std::string("precious"));
    const auto folder = file().parent_path();
    std::filesystem::create_directories(folder);

    std::filesystem::create_symlink(victim, folder / ".org.example.test.plist.new");
    EXPECT_TRUE(set("key", 1));
    std::filesystem::remove(folder / ".org.example.test.plist.lock");
    std::filesystem::create_symlink(victim, folder / ".org.example.test.plist.lock");
    EXPECT_FALSE(set("key", 2));

    EXPECT_EQ(TestFolders::bytesOf(victim), "precious");
    EXPECT_EQ(TestFolders::read(file()), List(List::Dictionary{{"key", 1}}));
}

TEST_F(PreferencesDurabilityTest, AnOrdinaryUserWritesNothingForTheMachine) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can become an ordinary user";
    ASSERT_TRUE(set("key", "old"));
    log().text();

    EXPECT_EQ(Forked([&] {
                  if (::setresuid(kOrdinaryUser, kOrdinaryUser, kOrdinaryUser) != 0) return 2;
                  FilePreferences preferences(world().folders());
                  preferences.setValue("key", "new", kDomain, User::Any);
                  if (preferences.synchronise(kDomain, User::Any)) return 3;
                  return preferences.value("key", kDomain, User::Any) == List("old") ? 0 : 4;
              }).wait(),
              0);

    EXPECT_EQ(TestFolders::read(file()), List(List::Dictionary{{"key", "old"}}));
    EXPECT_THAT(log().text(), HasSubstr("default preferences: " + file().string() +
                                        " was not written: Permission denied"));
}

TEST_F(PreferencesDurabilityTest, AFolderThatMayNotBeWrittenIsAFalseAnswer) {
    if (::geteuid() == 0) GTEST_SKIP() << "root may write everywhere";
    TestFolders::write(file(), List::Dictionary{{"key", "old"}});
    ::chmod(file().parent_path().c_str(), 0555);

    EXPECT_FALSE(set("key", "new"));

    ::chmod(file().parent_path().c_str(), 0755);
    EXPECT_EQ(TestFolders::read(file()), List(List::Dictionary{{"key", "old"}}));
}

TEST_F(PreferencesDurabilityTest, ARecordThatMayNotBeReadIsNotReplaced) {
    TestFolders::write(file(), List::Dictionary{{"key", "old"}});
    const auto kept = TestFolders::bytesOf(file());
    std::filesystem::rename(file(), file().parent_path() / "kept");
    std::filesystem::create_symlink(file().filename(), file());

    EXPECT_FALSE(set("key", "new"));

    EXPECT_TRUE(std::filesystem::is_symlink(file())) << "nobody knows what lies behind it";
    EXPECT_THAT(log().text(), HasSubstr("was not written: it cannot be read"));
}

TEST_F(PreferencesDurabilityTest, AFileThatMayGrowNoFurtherStaysTheOldOne) {
    ASSERT_TRUE(set("key", "old"));
    const auto before = TestFolders::bytesOf(file());

    EXPECT_EQ(Forked([&] {
                  const rlimit most{64, 64};
                  if (::signal(SIGXFSZ, SIG_IGN) == SIG_ERR) return 2;
                  if (::setrlimit(RLIMIT_FSIZE, &most) != 0) return 2;
                  return set("key", std::string(10'000, 'x')) ? 3 : 0;
              }).wait(),
              0);

    EXPECT_EQ(TestFolders::bytesOf(file()), before);
    EXPECT_EQ(namesIn(file().parent_path()).size(), 2U) << "the half file is gone";
}

// On a disk of four pages.
int writeToAFullDisk(TestFolders& world) {
    const auto& folder = world.folders().anyUser;
    if (!mountForThisProcess(folder.base, "tmpfs", "size=16k,mode=755")) return kUnavailable;
    FilePreferences preferences(world.folders());
    preferences.setValue("key", "old", kDomain, User::Any);
    if (!preferences.synchronise(kDomain, User::Any)) return 2;
    const auto before = TestFolders::bytesOf(world.record(User::Any));

    preferences.setValue("key", std::string(100'000, 'x'), kDomain, User::Any);
    if (preferences.synchronise(kDomain, User::Any)) return 3;
    if (preferences.value("key", kDomain, User::Any) != List("old")) return 4;
    if (TestFolders::bytesOf(world.record(User::Any)) != before) return 5;

    // There is room again for a small one, so nothing was left behind.
    preferences.setValue("key", std::string(5'000, 'x'), kDomain, User::Any);
    return preferences.synchronise(kDomain, User::Any) ? 0 : 6;
}

TEST_F(PreferencesDurabilityTest, AFullDiskLeavesTheOldFile) {
    const int status = Forked([&] { return writeToAFullDisk(world()); }).wait();

    if (status == kUnavailable) GTEST_SKIP() << "no file system can be mounted here";
    EXPECT_EQ(status, 0);
    EXPECT_THAT(log().text(), HasSubstr("No space left on device"));
}

TEST_F(PreferencesDurabilityTest, WhatCouldNotBeReadBackIsNotWritten) {
    ASSERT_TRUE(set("key", "old"));

    EXPECT_FALSE(set("key", "no UTF-8: \xFF"));
    EXPECT_FALSE(set("no UTF-8: \xFF", 1));
    EXPECT_FALSE(set("key", platform::Bytes(platform::kLargestRecord)));

    EXPECT_EQ(TestFolders::read(file()), List(List::Dictionary{{"key", "old"}}));
    EXPECT_THAT(log().text(), HasSubstr("a value is no property list, or the record is too large"));
}

// The confinement of the command: nothing to be read above the user's own folder, no file given
// away, no mode changed.
int writeInConfinement(TestFolders& world) {
    const auto& user = *world.folders().currentUser;
    std::vector<platform::LandlockRule> rules;
    rules.push_back({platform::FileDescriptor(
                         ::open((user.base + "/vlm").c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC)),
                     platform::PathAccess::Write});
    ::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
    const auto files = platform::enterLandlock(rules);
    if (files.errorNumber != 0) return kUnavailable;
    if (platform::enterSeccompFilter(platform::UnixSockets::Allowed).errorNumber != 0)
        return kUnavailable;
    FilePreferences preferences(world.folders());
    preferences.setValue("key", 1, kDomain, User::Any);
    if (preferences.synchronise(kDomain, User::Any)) return 2;
    for (int number = 0; number < 2; ++number) {
        preferences.setValue("key", number, kDomain, User::Current);
        if (!preferences.synchronise(kDomain, User::Current)) return 3;
        if (preferences.value("key", kDomain, User::Current) != List(number)) return 4;
    }
    return 0;
}

TEST_F(PreferencesDurabilityTest, AConfinedProcessWritesTheUsersRecord) {
    ASSERT_TRUE(::mkdir((world().folders().currentUser->base + "/vlm").c_str(), 0700) == 0);

    const int status = Forked([&] { return writeInConfinement(world()); }).wait();

    if (status == kUnavailable) GTEST_SKIP() << "this kernel lets no process confine itself here";
    EXPECT_EQ(status, 0);
}

}  // namespace

}  // namespace vlm::test
