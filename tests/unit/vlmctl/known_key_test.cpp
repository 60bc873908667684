#include "services/vlmctl/known_key.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace vlm::control {
namespace {

struct Row {
    const char* why;
    std::string key;
    std::optional<std::string_view> nearest;
};

TEST(NearestKey, IsTheOneThatWasProbablyMeant) {
    const Row rows[] = {
        {"a letter is missing", "alowSmartCard", "allowSmartCard"},
        {"a letter too many", "UserPairingg", "UserPairing"},
        {"another case", "userpairing", "UserPairing"},
        {"all in capitals", "ENFORCESMARTCARD", "enforceSmartCard"},
        {"another ending", "enforceSmartCards", "enforceSmartCard"},
        {"the one nearer of two like it", "allowUnmappedUser", "allowUnmappedUsers"},
        {"an entry of the configuration file", "AttributeMappings", "AttributeMapping"},
        {"nothing like it", "colour", std::nullopt},
        {"nothing at all", "", std::nullopt},
        {"a megabyte of text", std::string(1U << 20U, 'a'), std::nullopt},
    };
    for (const auto& [why, key, nearest] : rows) EXPECT_EQ(nearestKey(key), nearest) << why;
}

TEST(FindSetting, KnowsKeysByTheirExactSpelling) {
    ASSERT_NE(findSetting("UserPairing"), nullptr);
    EXPECT_EQ(findSetting("UserPairing")->defaultValue, 1);
    EXPECT_EQ(findSetting("userPairing"), nullptr);
    EXPECT_EQ(findSetting("AttributeMapping"), nullptr);
}

TEST(UnknownKey, IsToldWithAHint) {
    EXPECT_EQ(unknownKey("userPairing"),
              "there is no setting \"userPairing\"; did you mean \"UserPairing\"?");
    EXPECT_THAT(unknownKey("colour"), testing::HasSubstr("\"vlmctl settings\" lists them"));
    EXPECT_THAT(unknownKey("AttributeMapping"), testing::HasSubstr("\"vlmctl settings\""));
}

}  // namespace
}  // namespace vlm::control
