// Several writers of one record: processes, threads, and such as are killed or hang.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/file_preferences.h"
#include "tests/integration/preferences/forked.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

using namespace std::chrono_literals;
using platform::FilePreferences;

// The subject is who writes when, not how fast the disk is: in memory where there is such a place.
class PreferencesWritersTest : public ::testing::Test {
protected:
    PreferencesWritersTest() {
        constexpr const char* kMemory = "/dev/shm";
        if (::access(kMemory, W_OK) == 0) ::setenv("TMPDIR", kMemory, 1);
        _world.emplace();
        ::unsetenv("TMPDIR");
        std::filesystem::create_directories(file().parent_path());
        ::chmod(file().parent_path().c_str(), 0755);
    }

    TestFolders& world() { return *_world; }
    Path file() const { return _world->record(User::Any); }
    Path beside(const std::string& ending) const {
        return file().parent_path() / ("." + std::string(kDomain) + ".plist" + ending);
    }

private:
    std::optional<TestFolders> _world;
};

// Sets keys of its own, again and again, and looks each time whether the last value is still there.
// The exit status tells what went wrong, 0 for nothing.
constexpr int kKeys = 2;
int writeOwnKeys(const platform::PreferencesFolders& folders, int writer, int times) {
    FilePreferences preferences(folders);
    for (int number = 0; number < times; ++number) {
        const std::string key = std::to_string(writer) + "." + std::to_string(number % kKeys);
        const auto before = preferences.value(key, kDomain, User::Any);
        if (number < kKeys ? before.has_value() : before != List(number - kKeys)) return 1;
        preferences.setValue(key, number, kDomain, User::Any);
        if (!preferences.synchronise(kDomain, User::Any)) return 2;
    }
    return 0;
}

TEST_F(PreferencesWritersTest, EightProcessesLoseNothingOfAThousandWritesEach) {
    constexpr int kWriters = 8;
    constexpr int kTimes = 1000;
    std::vector<Forked> writers;
    writers.reserve(kWriters);
    for (int writer = 0; writer < kWriters; ++writer)
        writers.emplace_back([&] { return writeOwnKeys(world().folders(), writer, kTimes); });

    for (auto& writer : writers) EXPECT_EQ(writer.wait(), 0) << "1: lost, 2: not written";

    FilePreferences preferences(world().folders());
    for (int writer = 0; writer < kWriters; ++writer)
        for (int key = 0; key < kKeys; ++key)
            EXPECT_EQ(preferences.value(std::to_string(writer) + "." + std::to_string(key), kDomain,
                                        User::Any),
                      kTimes - kKeys + key);
}

// Writes the same number under two keys, with a filler between them of a size that changes.
int writePairs(const platform::PreferencesFolders& folders, int first) {
    FilePreferences preferences(folders);
    for (int number = first;; ++number) {
        preferences.setValue("a", number, kDomain, User::Any);
        preferences.setValue("filler", platform::Bytes(static_cast<std::size_t>(number % 50) * 997),
                             kDomain, User::Any);
        preferences.setValue("b", number, kDomain, User::Any);
        if (!preferences.synchronise(kDomain, User::Any)) return 1;
    }
}

TEST_F(PreferencesWritersTest, AWriterThatIsKilledLeavesTheFileWholeAndTheLockFree) {
    constexpr int kKills = 300;
    constexpr int kMostKills = 3000;  // where a busy machine keeps writers from getting so far
    std::mt19937 random(std::random_device{}());
    FilePreferences preferences(world().folders());
    int killedWhileWriting = 0;

    for (int kill = 0; kill < kKills || (killedWhileWriting == 0 && kill < kMostKills); ++kill) {
        std::uniform_int_distribution<int> microseconds(0, 3000 + 10 * kill);
        Forked writer([&] { return writePairs(world().folders(), kill * 10'000); });
        std::this_thread::sleep_for(std::chrono::microseconds(microseconds(random)));
        writer.kill();

        if (std::filesystem::exists(beside(".new"))) ++killedWhileWriting;
        if (std::filesystem::exists(file())) {
            const auto whole = TestFolders::read(file());
            ASSERT_TRUE(whole && whole->dictionary()) << "after kill " << kill;
        }
        ASSERT_EQ(preferences.value("a", kDomain, User::Any),
                  preferences.value("b", kDomain, User::Any))
            << "after kill " << kill;
        const auto start = std::chrono::steady_clock::now();
        preferences.setValue("kills", kill, kDomain, User::Any);
        ASSERT_TRUE(preferences.synchronise(kDomain, User::Any)) << "after kill " << kill;
        EXPECT_LT(std::chrono::steady_clock::now() - start, 5s) << "the lock was not free";
    }

    EXPECT_GT(killedWhileWriting, 0) << "no kill has hit a write";
    EXPECT_FALSE(std::filesystem::exists(beside(".new"))) << "what the killed have left";
}

TEST_F(PreferencesWritersTest, AReaderNeverSeesHalfAFile) {
    TestFolders::write(file(), List::Dictionary{{"a", -1}, {"b", -1}});
    const Forked writer([&] { return writePairs(world().folders(), 0); });
    int last = -1;
    int changes = 0;

    constexpr int kEnough = 10;
    const auto start = std::chrono::steady_clock::now();
    const auto elapsed = [start] { return std::chrono::steady_clock::now() - start; };
    // A busy machine may keep the writer waiting.
    while (elapsed() < 500ms || (changes < kEnough && elapsed() < 60s)) {
        const auto whole = TestFolders::read(file());
        ASSERT_TRUE(whole && whole->dictionary());
        const auto* first = whole->dictionary()->find("a");
        const auto* second = whole->dictionary()->find("b");
        ASSERT_TRUE(first && second);
        ASSERT_EQ(*first, *second);
        const auto number = static_cast<int>(first->integer().value_or(-2));
        ASSERT_GE(number, last) << "an older one came back";
        if (number != last) ++changes;
        last = number;
    }

    EXPECT_GE(changes, kEnough) << "there was nothing to see";
}

TEST_F(PreferencesWritersTest, AWriterThatHangsStopsTheOthersForABoundedTimeOnly) {
    const platform::FileDescriptor held(
        ::open(beside(".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
    ASSERT_EQ(::flock(held.get(), LOCK_EX), 0);
    world().folders().anyUser.patience = 100ms;
    FilePreferences preferences(world().folders());
    preferences.setValue("key", 1, kDomain, User::Any);
    CapturedLog log;
    const auto start = std::chrono::steady_clock::now();

    EXPECT_FALSE(preferences.synchronise(kDomain, User::Any));

    EXPECT_GE(std::chrono::steady_clock::now() - start, 100ms);
    EXPECT_THAT(log.text(), ::testing::HasSubstr("another process keeps its lock"));
    ASSERT_EQ(::flock(held.get(), LOCK_UN), 0);
    preferences.setValue("key", 2, kDomain, User::Any);
    EXPECT_TRUE(preferences.synchronise(kDomain, User::Any));
}

TEST_F(PreferencesWritersTest, TheLockStaysForGoodAndIsForTheOwnerAlone) {
    FilePreferences preferences(world().folders());
    struct stat first {};
    struct stat second {};

    for (auto* status : {&first, &second}) {
        preferences.setValue("key", 1, kDomain, User::Any);
        ASSERT_TRUE(preferences.synchronise(kDomain, User::Any));
        ASSERT_EQ(::stat(beside(".lock").c_str(), status), 0);
    }

    EXPECT_EQ(first.st_ino, second.st_ino);
    EXPECT_EQ(first.st_mode & 0777U, 0600U) << "whoever can open it can keep others waiting";
}

TEST_F(PreferencesWritersTest, AChildThatWasForkedWhileAnotherThreadWroteHoldsNoLock) {
    FilePreferences preferences(world().folders());
    std::atomic<bool> isEnough = false;
    std::thread writer([&] {
        for (int number = 0; !isEnough; ++number) {
            preferences.setValue("key", number, kDomain, User::Any);
            EXPECT_TRUE(preferences.synchronise(kDomain, User::Any));
        }
    });
    constexpr int kChildren = 50;
    std::vector<Forked> children;
    children.reserve(kChildren);
    for (int child = 0; child < kChildren; ++child) children.emplace_back([] { return ::pause(); });
    isEnough = true;
    writer.join();

    world().folders().anyUser.patience = 100ms;
    FilePreferences other(world().folders());
    other.setValue("other", 1, kDomain, User::Any);
    EXPECT_TRUE(other.synchronise(kDomain, User::Any));
}

TEST_F(PreferencesWritersTest, ThreadsOfOneProcessLoseNothingAndReadWhatWasSet) {
    constexpr int kThreads = 4;
    constexpr int kTimes = 100;
    FilePreferences preferences(world().folders());
    std::atomic<bool> isEnough = false;
    std::thread reader([&] {
        while (!isEnough) {
            preferences.applicationValue("0", kDomain);
            preferences.isForced("0", kDomain);
        }
    });
    std::vector<std::thread> threads;
    threads.reserve(kThreads);
    for (int thread = 0; thread < kThreads; ++thread)
        threads.emplace_back([&, key = std::to_string(thread)] {
            for (int number = 0; number < kTimes; ++number) {
                preferences.setValue(key, number, kDomain, User::Any);
                EXPECT_EQ(preferences.value(key, kDomain, User::Any), number);
                EXPECT_TRUE(preferences.synchronise(kDomain, User::Any));
                EXPECT_EQ(preferences.value(key, kDomain, User::Any), number);
            }
        });
    for (auto& thread : threads) thread.join();
    isEnough = true;
    reader.join();

    FilePreferences fresh(world().folders());
    for (int thread = 0; thread < kThreads; ++thread)
        EXPECT_EQ(fresh.value(std::to_string(thread), kDomain, User::Any), kTimes - 1);
}

}  // namespace

}  // namespace vlm::test
