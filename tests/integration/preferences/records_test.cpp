// What counts as a record, and what is told about a file that does not.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <ctime>
#include <string>

#include "platform/linux/file_preferences.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

using ::testing::HasSubstr;
using ::testing::IsEmpty;

constexpr uid_t kSomebodyElse = 65534;

class PreferencesRecordTest : public ::testing::Test {
protected:
    std::optional<List> anyValue() { return preferences().value("key", kDomain, User::Any); }
    std::optional<List> ownValue() { return preferences().value("key", kDomain, User::Current); }

    platform::FilePreferences& preferences() { return _preferences; }
    TestFolders& world() { return _world; }
    CapturedLog& log() { return _log; }

    static List one() { return List::Dictionary{{"key", 1}}; }

private:
    CapturedLog _log;
    TestFolders _world;
    platform::FilePreferences _preferences{_world.folders()};
};

TEST_F(PreferencesRecordTest, AMissingOneIsNothingToTell) {
    EXPECT_EQ(anyValue(), std::nullopt);
    EXPECT_EQ(ownValue(), std::nullopt);
    EXPECT_FALSE(preferences().isForced("key", kDomain));
    EXPECT_THAT(log().text(), IsEmpty());
}

TEST_F(PreferencesRecordTest, AMalformedOneCountsAsAbsentAndIsTold) {
    const std::string good = TestFolders::binary(one());
    const struct {
        std::string content;
        const char* why;
    } rows[] = {
        {"", "an empty file"},
        {std::string(100, '\0'), "zeros, as a crash can leave them"},
        {good.substr(0, good.size() - 1), "a list cut short"},
        {"bplist00", "a head without a body"},
        {TestFolders::binary(List::Array{1, 2}), "a list that is no dictionary"},
        {std::string(5U << 20U, 'x'), "a file too large to be read"},
    };

    for (const auto& row : rows) {
        TestFolders::write(world().managed(), row.content);
        EXPECT_FALSE(preferences().isForced("key", kDomain)) << row.why;
        EXPECT_EQ(preferences().applicationValue("key", kDomain), std::nullopt) << row.why;
        EXPECT_THAT(log().text(), HasSubstr("error preferences: " + world().managed().string() +
                                            " counts as absent: it "))
            << row.why;
    }
}

TEST_F(PreferencesRecordTest, AMalformedOneHidesNoOther) {
    TestFolders::write(world().managed(), std::string("nonsense"));
    TestFolders::write(world().record(User::Current), std::string("nonsense"));
    TestFolders::write(world().record(User::Any), one());

    EXPECT_EQ(preferences().applicationValue("key", kDomain), 1);
}

TEST_F(PreferencesRecordTest, IsToldOnceForEachMalformedContent) {
    TestFolders::write(world().record(User::Any), std::string("bplist00 one"));
    for (int reading = 0; reading < 5; ++reading) anyValue();
    EXPECT_EQ(log().lines(), 1);

    TestFolders::write(world().record(User::Any), std::string("bplist00 one"));
    anyValue();
    EXPECT_EQ(log().lines(), 0) << "the same content in a new file";

    TestFolders::write(world().record(User::Any), std::string("bplist00 two"));
    anyValue();
    EXPECT_EQ(log().lines(), 1) << "another content";

    TestFolders::write(world().record(User::Any), one());
    anyValue();
    TestFolders::write(world().record(User::Any), std::string("bplist00 two"));
    anyValue();
    EXPECT_EQ(log().lines(), 1) << "malformed again after it was mended";
}

TEST_F(PreferencesRecordTest, TheLargestOneIsRead) {
    const auto file = world().record(User::Any);
    const auto bytes = [](std::size_t size) {
        return List::Dictionary{{"key", 1}, {"filler", platform::Bytes(size)}};
    };
    const std::size_t around = TestFolders::binary(bytes(3U << 20U)).size() - (3U << 20U);

    TestFolders::write(file, bytes(platform::kLargestRecord - around));
    ASSERT_EQ(std::filesystem::file_size(file), platform::kLargestRecord);
    EXPECT_EQ(anyValue(), 1);

    TestFolders::write(file, bytes(platform::kLargestRecord - around + 1));
    EXPECT_EQ(anyValue(), std::nullopt);
}

TEST_F(PreferencesRecordTest, ASparseFileOfTwoGibibytesIsAnsweredAtOnceAndInLittleMemory) {
    const auto file = world().record(User::Any);
    TestFolders::write(file, std::string());
    ASSERT_EQ(::truncate(file.c_str(), off_t{2} << 30U), 0);
    rusage before{};
    ::getrusage(RUSAGE_SELF, &before);
    const auto start = std::clock();

    EXPECT_EQ(anyValue(), std::nullopt);

    EXPECT_LT(std::clock() - start, CLOCKS_PER_SEC / 10) << "time of the processor";
    rusage after{};
    ::getrusage(RUSAGE_SELF, &after);
    EXPECT_LT(after.ru_maxrss - before.ru_maxrss, 16 * 1024) << "kibibytes";
    EXPECT_THAT(log().text(), HasSubstr("it is larger than 4194304 bytes"));
}

TEST_F(PreferencesRecordTest, APipeInItsPlaceMakesNobodyWait) {
    const auto file = world().record(User::Any);
    std::filesystem::create_directories(file.parent_path());
    ASSERT_EQ(::mkfifo(file.c_str(), 0600), 0);

    EXPECT_EQ(anyValue(), std::nullopt);

    EXPECT_THAT(log().text(), HasSubstr("it is not a plain file"));
}

TEST_F(PreferencesRecordTest, AFolderInItsPlaceCountsAsAbsent) {
    std::filesystem::create_directories(world().record(User::Any));

    EXPECT_EQ(anyValue(), std::nullopt);

    EXPECT_THAT(log().text(), HasSubstr("it is not a plain file"));
}

TEST_F(PreferencesRecordTest, ADeviceInItsPlaceIsNotRead) {
    const auto file = world().record(User::Any);
    std::filesystem::create_directories(file.parent_path());
    std::filesystem::create_symlink("/dev/zero", file);

    EXPECT_EQ(anyValue(), std::nullopt);

    EXPECT_THAT(log().text(), HasSubstr("it is not a plain file"));
}

TEST_F(PreferencesRecordTest, ALinkIsReadThrough) {
    const auto elsewhere = world().managed("elsewhere");
    TestFolders::write(elsewhere, one());
    std::filesystem::create_directories(world().record(User::Any).parent_path());
    std::filesystem::create_symlink(elsewhere, world().record(User::Any));
    EXPECT_EQ(anyValue(), 1);

    TestFolders::write(elsewhere, List::Dictionary{{"key", 2}});

    EXPECT_EQ(anyValue(), 2) << "a change behind the link is seen too";
}

TEST_F(PreferencesRecordTest, ALinkToNothingAndALinkToItselfCountAsAbsent) {
    const auto file = world().record(User::Any);
    std::filesystem::create_directories(file.parent_path());
    std::filesystem::create_symlink("nowhere", file);
    EXPECT_EQ(anyValue(), std::nullopt);
    EXPECT_THAT(log().text(), IsEmpty());

    std::filesystem::remove(file);
    std::filesystem::create_symlink(file.filename(), file);
    EXPECT_EQ(anyValue(), std::nullopt);
    EXPECT_THAT(log().text(), HasSubstr("it cannot be read"));
}

TEST_F(PreferencesRecordTest, TheMachinesCountsOnlyWhenNobodyElseCanHaveWrittenIt) {
    const struct {
        mode_t file, folder;
        bool counts;
        const char* why;
    } rows[] = {
        {0644, 0755, true, "as it is made"},           {0600, 0700, true, "even stricter"},
        {0664, 0755, false, "a group may write it"},   {0646, 0755, false, "all may write it"},
        {0644, 0775, false, "a group may replace it"}, {0644, 0757, false, "all may replace it"},
        {0644, 01777, false, "all may make one here"},
    };
    for (const auto& file : {world().managed(), world().record(User::Any)}) {
        TestFolders::write(file, one());
        for (const auto& row : rows) {
            ::chmod(file.c_str(), row.file);
            ::chmod(file.parent_path().c_str(), row.folder);
            log().text();
            platform::FilePreferences fresh(world().folders());

            const auto decided = fresh.applicationValue("key", kDomain);

            EXPECT_EQ(decided.has_value(), row.counts) << file << ": " << row.why;
            EXPECT_EQ(log().lines(), row.counts ? 0 : 1) << file << ": " << row.why;
        }
        std::filesystem::remove(file);
        ::chmod(file.parent_path().c_str(), 0755);
    }
}

TEST_F(PreferencesRecordTest, TheUsersCountsAlsoWhenTheUsersGroupMayWriteIt) {
    const auto file = world().record(User::Current);
    TestFolders::write(file, one());

    ::chmod(file.c_str(), 0664);
    EXPECT_EQ(ownValue(), 1);
    ::chmod(file.c_str(), 0666);
    EXPECT_EQ(ownValue(), std::nullopt);
}

TEST_F(PreferencesRecordTest, OneThatSomebodyElseOwnsDoesNotCount) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can give a file to another user";
    for (const auto& file :
         {world().managed(), world().record(User::Any), world().record(User::Current)}) {
        TestFolders::write(file, one());
        ASSERT_TRUE(preferences().applicationValue("key", kDomain));

        ASSERT_EQ(::chown(file.c_str(), kSomebodyElse, kSomebodyElse), 0);

        EXPECT_EQ(preferences().applicationValue("key", kDomain), std::nullopt) << file;
        EXPECT_THAT(log().text(), HasSubstr("not only the user with the id 0 can write it"));
    }
}

TEST_F(PreferencesRecordTest, OneThatMayNotBeReadIsToldOnceAndSeenWhenItMay) {
    if (::geteuid() == 0) GTEST_SKIP() << "root may read everything";
    const auto file = world().record(User::Any);
    TestFolders::write(file, one());
    ::chmod(file.c_str(), 0);

    for (int reading = 0; reading < 3; ++reading) EXPECT_EQ(anyValue(), std::nullopt);

    EXPECT_EQ(log().lines(), 1);
    ::chmod(file.c_str(), 0644);
    EXPECT_EQ(anyValue(), 1);
}

TEST_F(PreferencesRecordTest, AUserWithoutAHomeHasNone) {
    auto homeless = world().folders();
    homeless.currentUser.reset();
    platform::FilePreferences without(homeless);

    without.setValue("key", 1, kDomain, User::Current);

    EXPECT_EQ(without.value("key", kDomain, User::Current), 1);
    EXPECT_FALSE(without.synchronise(kDomain, User::Current));
    EXPECT_EQ(without.value("key", kDomain, User::Current), std::nullopt);
}

}  // namespace

}  // namespace vlm::test
