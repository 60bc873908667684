#include "platform/linux/landlock_ruleset.h"

#include <gtest/gtest.h>
#include <linux/landlock.h>

namespace vlm::platform {

namespace {

constexpr std::uint64_t kTruncate = 1ULL << 14U;
constexpr std::uint64_t kIoctlDevice = 1ULL << 15U;
constexpr int kNewest = 7;

}  // namespace

TEST(LandlockRulesetTest, AsksForNoMoreThanAVersionKnows) {
    struct Row {
        int version;
        LandlockRights rights;
        const char* why;
    };
    const Row rows[] = {
        {0, {0, 0, 0}, "no Landlock"},
        {1, {(1ULL << 13U) - 1, 0, 0}, "the thirteen first rights on files"},
        {2, {(1ULL << 14U) - 1, 0, 0}, "moving between folders"},
        {3, {(1ULL << 15U) - 1, 0, 0}, "truncation"},
        {4, {(1ULL << 15U) - 1, 3, 0}, "TCP"},
        {5, {(1ULL << 16U) - 1, 3, 0}, "control of devices"},
        {6, {(1ULL << 16U) - 1, 3, 2}, "signals, not abstract sockets"},
        {7, {(1ULL << 16U) - 1, 3, 2}, "nothing new for us"},
        {99, {(1ULL << 16U) - 1, 3, 2}, "a version from the future takes what we know"},
    };
    for (const auto& row : rows) EXPECT_EQ(landlockRights(row.version), row.rights) << row.why;
}

TEST(LandlockRulesetTest, NamesWhatAVersionLeavesOpen) {
    using List = std::vector<std::string_view>;

    EXPECT_EQ(leftOpenByLandlock(0),
              (List{"files outside the tool's folders", "signals to other programs"}));
    for (const int version : {1, 2, 3, 4})
        EXPECT_EQ(leftOpenByLandlock(version),
                  (List{"control of devices", "signals to other programs"}));
    EXPECT_EQ(leftOpenByLandlock(5), List{"signals to other programs"});
    for (const int version : {6, 7}) EXPECT_EQ(leftOpenByLandlock(version), List{});
}

TEST(LandlockRulesetTest, NoRuleLetsAProgramStartOrADeviceBeMadeOrControlled) {
    const auto handled = landlockRights(kNewest).files;
    const auto never = LANDLOCK_ACCESS_FS_EXECUTE | LANDLOCK_ACCESS_FS_MAKE_CHAR |
                       LANDLOCK_ACCESS_FS_MAKE_BLOCK | kIoctlDevice;

    EXPECT_EQ(allowedFileRights(PathAccess::Write, true, handled), handled & ~never);
    EXPECT_EQ(allowedFileRights(PathAccess::Read, true, handled),
              LANDLOCK_ACCESS_FS_READ_FILE | LANDLOCK_ACCESS_FS_READ_DIR);
}

TEST(LandlockRulesetTest, ARuleOnAFileGivesOnlyWhatAFileHas) {
    const auto handled = landlockRights(kNewest).files;

    EXPECT_EQ(allowedFileRights(PathAccess::Read, false, handled), LANDLOCK_ACCESS_FS_READ_FILE);
    EXPECT_EQ(allowedFileRights(PathAccess::Write, false, handled),
              LANDLOCK_ACCESS_FS_READ_FILE | LANDLOCK_ACCESS_FS_WRITE_FILE | kTruncate);
}

TEST(LandlockRulesetTest, ARuleGivesNothingThatTheVersionDoesNotKnow) {
    const auto handled = landlockRights(1).files;

    for (const bool isFolder : {false, true})
        EXPECT_EQ(allowedFileRights(PathAccess::Write, isFolder, handled) & ~handled, 0U);
}

}  // namespace vlm::platform
