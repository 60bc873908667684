// What a record may hold about a setting, and what follows from it, worked out apart from the code
// under test.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string_view>

#include "settings/smartcard_settings.h"

namespace vlm {

struct StoredCase {
    const char* name;
    const char* xml;  // the value in a property list; null for no value
    bool isThere;     // whether the record has the key at all
    std::optional<std::int32_t> number;
};

// A record that is malformed has no key at all.
inline constexpr const char* kMalformed = "malformed";
inline constexpr std::array<StoredCase, 9> kStoredCases = {{
    {"absent", nullptr, false, std::nullopt},
    {"false", "<false/>", true, 0},
    {"true", "<true/>", true, 1},
    {"0", "<integer>0</integer>", true, 0},
    {"1", "<integer>1</integer>", true, 1},
    {"5", "<integer>5</integer>", true, 5},
    {"\"1\"", "<string>1</string>", true, std::nullopt},
    {"bytes", "<data>AQ==</data>", true, std::nullopt},
    {kMalformed, "<integer>", false, std::nullopt},
}};

struct SettingCase {
    std::string_view key;
    std::int32_t defaultValue;
    bool managementCounts;
};

inline constexpr std::array<SettingCase, 8> kSettingCases = {{
    {"allowSmartCard", 1, true},
    {"UserPairing", 1, true},
    {"oneCardPerUser", 0, true},
    {"checkCertificateTrust", 0, true},
    {"useLocalOd", 0, true},
    {"enforceSmartCard", 0, true},
    {"allowUnmappedUsers", 0, false},
    {"anyOtherKey", 0, true},
}};

struct ExpectedSetting {
    std::int32_t value;
    SmartcardSettingOrigin origin;
};

// The user's own record has no say.
inline ExpectedSetting expectedSetting(const SettingCase& setting, const StoredCase& managed,
                                       const StoredCase& machine) {
    const bool forced = setting.managementCounts && managed.isThere;
    const auto number = forced ? managed.number : machine.number;
    if (!number) return {setting.defaultValue, SmartcardSettingOrigin::Default};
    return {*number, forced ? SmartcardSettingOrigin::Managed : SmartcardSettingOrigin::Machine};
}

}  // namespace vlm
