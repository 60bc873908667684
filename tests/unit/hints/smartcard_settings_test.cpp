#include "settings/smartcard_settings.h"

#include "hints_test.h"

namespace vlm::hints {
namespace {

struct Row {
    const char* key;
    std::int32_t value;
};

const Row kDefaults[] = {
    {"allowSmartCard", 1}, {"UserPairing", 1},        {"oneCardPerUser", 0},
    {"useLocalOd", 0},     {"enforceSmartCard", 0},   {"checkCertificateTrust", 0},
    {"userpairing", 0},    {"allowUnmappedUsers", 0}, {"", 0},
};

class SmartcardSetting : public HintsTest {};

TEST_F(SmartcardSetting, IsOnByDefaultForTheTwoThatLetCardsBeUsedOnly) {
    for (const auto& row : kDefaults) {
        SCOPED_TRACE(row.key);
        EXPECT_EQ(VLGetSmartcardSetting(row.key), row.value);
    }
}

TEST_F(SmartcardSetting, IsTheSameHoweverItsKeyIsStored) {
    EXPECT_EQ(VLGetSmartcardSetting(String::fromUtf16(u"UserPairing")), 1);
}

TEST_F(SmartcardSetting, IsToldToTheLog) {
    VLGetSmartcardSetting("UserPairing");

    EXPECT_EQ(logged(),
              (std::vector<std::string>{"info: VLGetSmartcardSetting UserPairing",
                                        "info: Using default value", "info: Returning value 1"}));
}

}  // namespace
}  // namespace vlm::hints
