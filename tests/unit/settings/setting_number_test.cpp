#include <cmath>
#include <limits>

#include "settings/smartcard_settings.h"
#include "settings_fixture.h"

namespace vlm {
namespace {

using platform::PropertyList;

struct Row {
    PropertyList stored;
    std::int32_t value;
    const char* why;
};

constexpr std::int32_t kLowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kHighest = std::numeric_limits<std::int32_t>::max();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

// Of a setting whose default is 1, so that 0 is never a value that was passed over.
const Row kNumbers[] = {
    {false, 0, "false is 0"},
    {true, 1, "true is 1"},
    {0, 0, "zero"},
    {5, 5, "a number is returned as it is"},
    {-1, -1, "numbers have a sign"},
    {std::int64_t{kHighest}, kHighest, "the highest"},
    {std::int64_t{kLowest}, kLowest, "the lowest"},
    {std::int64_t{kHighest} + 1, kLowest, "of a wider one the low 32 bits"},
    {std::int64_t{kLowest} - 1, kHighest, "of a wider negative one too"},
    {std::int64_t{1} << 32U, 0, "whose low 32 bits may be zero"},
    {(std::int64_t{1} << 32U) + 5, 5, "or look like a small number"},
    {std::numeric_limits<std::int64_t>::min(), 0, "the lowest of 64 bits"},
    {std::numeric_limits<std::int64_t>::max(), -1, "the highest of 64 bits"},
    {std::numeric_limits<std::uint64_t>::max(), -1, "the highest without a sign"},
    {(std::uint64_t{1} << 63U) + 7, 7, "just beyond the signed range"},
    {0.0, 0, "zero as a real"},
    {-0.0, 0, "negative zero"},
    {0.9, 0, "a real is cut"},
    {-0.9, 0, "toward zero"},
    {1.0, 1, "a whole real"},
    {5.99, 5, "not rounded"},
    {-5.99, -5, "not rounded down"},
    {2147483647.5, kHighest, "cut to the highest"},
    {2147483648.0, kHighest, "the nearest number that there is"},
    {-2147483648.9, kLowest, "cut to the lowest"},
    {4294967296.0, kHighest, "a real has no low bits"},
    {1e300, kHighest, "huge"},
    {-1e300, kLowest, "huge and negative"},
    {kInfinity, kHighest, "infinite"},
    {-kInfinity, kLowest, "infinite and negative"},
    {std::nan(""), 0, "not a number"},
};

// Each of these counts as absent.
const Row kOthers[] = {
    {"1", 1, "a text"},
    {"", 1, "the empty text"},
    {platform::Bytes{0}, 1, "bytes"},
    {platform::Bytes{}, 1, "no bytes"},
    {PropertyList::Date{0}, 1, "a date"},
    {PropertyList::Array{0}, 1, "an array"},
    {PropertyList::Dictionary{{"UserPairing", 0}}, 1, "a dictionary"},
};

class SettingNumber : public SettingsTest {};

TEST_F(SettingNumber, IsASigned32BitIntegerWhicheverNumberIsStored) {
    for (const auto& row : kNumbers) {
        SCOPED_TRACE(row.why);
        setForMachine("UserPairing", row.stored);
        force("allowSmartCard", row.stored);

        EXPECT_EQ(VLGetSmartcardSetting("UserPairing"), row.value);
        EXPECT_EQ(VLGetSmartcardSetting("allowSmartCard"), row.value);
        EXPECT_EQ(VLGetSmartcardSettingOrigin("UserPairing"), SmartcardSettingOrigin::Machine);
        EXPECT_EQ(VLGetSmartcardSettingOrigin("allowSmartCard"), SmartcardSettingOrigin::Managed);
    }
}

TEST_F(SettingNumber, IsTheDefaultForAnyOtherType) {
    for (const auto& row : kOthers) {
        SCOPED_TRACE(row.why);
        setForMachine("UserPairing", row.stored);
        force("allowSmartCard", row.stored);

        EXPECT_EQ(VLGetSmartcardSetting("UserPairing"), row.value);
        EXPECT_EQ(VLGetSmartcardSetting("allowSmartCard"), row.value);
        EXPECT_EQ(VLGetSmartcardSettingOrigin("UserPairing"), SmartcardSettingOrigin::Default);
        EXPECT_EQ(VLGetSmartcardSettingOrigin("allowSmartCard"), SmartcardSettingOrigin::Default);
    }
}

}  // namespace
}  // namespace vlm
