// A file that does not count is never overwritten: the next write keeps it aside and tells where.

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "platform/linux/file_preferences.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

using ::testing::HasSubstr;
using ::testing::Not;

class PreferencesSetAsideTest : public ::testing::Test {
protected:
    bool set(int number) {
        platform::FilePreferences preferences(_world.folders());
        preferences.setValue("key", number, kDomain, User::Any);
        return preferences.synchronise(kDomain, User::Any);
    }

    Path file() const { return _world.record(User::Any); }
    Path aside(const std::string& ending) const { return file().string() + ending; }
    static List holding(int number) { return List::Dictionary{{"key", number}}; }
    CapturedLog& log() { return _log; }

private:
    CapturedLog _log;
    TestFolders _world;
};

TEST_F(PreferencesSetAsideTest, AMalformedFileIsKeptAndNamedInTheLog) {
    TestFolders::write(file(), std::string("bplist00 broken"));

    ASSERT_TRUE(set(1));

    EXPECT_EQ(TestFolders::bytesOf(aside(".malformed-1")), "bplist00 broken");
    EXPECT_EQ(TestFolders::read(file()), holding(1));
    EXPECT_THAT(log().text(), HasSubstr("error preferences: " + file().string() +
                                        " was kept aside as org.example.test.plist.malformed-1: "
                                        "it is no property list"));
}

TEST_F(PreferencesSetAsideTest, AnEarlierOneIsNeverOverwritten) {
    for (const char* content : {"first", "second", "third"}) {
        TestFolders::write(file(), "bplist00 " + std::string(content));
        ASSERT_TRUE(set(1));
    }

    EXPECT_EQ(TestFolders::bytesOf(aside(".malformed-1")), "bplist00 first");
    EXPECT_EQ(TestFolders::bytesOf(aside(".malformed-2")), "bplist00 second");
    EXPECT_EQ(TestFolders::bytesOf(aside(".malformed-3")), "bplist00 third");
}

TEST_F(PreferencesSetAsideTest, ALinkUnderTheNameCountsAsTaken) {
    TestFolders::write(file(), std::string("bplist00 broken"));
    std::filesystem::create_symlink("nowhere", aside(".malformed-1"));

    ASSERT_TRUE(set(1));

    EXPECT_TRUE(std::filesystem::is_symlink(aside(".malformed-1")));
    EXPECT_EQ(TestFolders::bytesOf(aside(".malformed-2")), "bplist00 broken");
}

TEST_F(PreferencesSetAsideTest, AFileThatIsNotTrustedIsKeptAndNotTakenOver) {
    TestFolders::write(file(), List::Dictionary{{"smuggled", 1}});
    ::chmod(file().c_str(), 0666);

    ASSERT_TRUE(set(1));

    EXPECT_EQ(TestFolders::read(file()), holding(1));
    EXPECT_EQ(TestFolders::read(aside(".untrusted-1")), List(List::Dictionary{{"smuggled", 1}}));
    EXPECT_THAT(log().text(), HasSubstr("org.example.test.plist.untrusted-1"));
}

TEST_F(PreferencesSetAsideTest, APipeAndAFolderGiveWayToo) {
    std::filesystem::create_directories(file());
    ASSERT_TRUE(set(1));
    EXPECT_TRUE(std::filesystem::is_directory(aside(".malformed-1")));

    std::filesystem::remove(file());
    ASSERT_EQ(::mkfifo(file().c_str(), 0600), 0);
    ASSERT_TRUE(set(2));
    EXPECT_TRUE(std::filesystem::is_fifo(aside(".malformed-2")));
    EXPECT_EQ(TestFolders::read(file()), holding(2));
}

TEST_F(PreferencesSetAsideTest, AWriteThatFailsLeavesItInItsPlace) {
    TestFolders::write(file(), std::string("bplist00 broken"));
    std::filesystem::create_directory(file().parent_path() / ".org.example.test.plist.new");

    EXPECT_FALSE(set(1));

    EXPECT_EQ(TestFolders::bytesOf(file()), "bplist00 broken");
    EXPECT_THAT(log().text(), Not(HasSubstr("kept aside")));
}

}  // namespace

}  // namespace vlm::test
