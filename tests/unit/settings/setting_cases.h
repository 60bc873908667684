// What a record may hold about a setting, and what follows from it, worked out apart from the code
// under test.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/property_list.h"
#include "settings/smartcard_settings.h"

namespace vlm {

struct StoredCase {
    std::string name;
    std::optional<platform::PropertyList> value;  // what the record holds under the key
    std::optional<std::int32_t> number;           // that it counts as
    bool isMalformed = false;                     // the whole record
};

inline const std::vector<StoredCase>& storedCases() {
    static const std::vector<StoredCase> cases = {
        {"absent", std::nullopt, std::nullopt},
        {"false", false, 0},
        {"true", true, 1},
        {"0", 0, 0},
        {"1", 1, 1},
        {"5", 5, 5},
        {"\"1\"", "1", std::nullopt},
        {"bytes", platform::Bytes{1}, std::nullopt},
        {"malformed", std::nullopt, std::nullopt, /*isMalformed=*/true},
    };
    return cases;
}

struct SettingCase {
    std::string key;
    std::int32_t defaultValue;
    bool managementCounts;
};

inline const std::vector<SettingCase>& settingCases() {
    static const std::vector<SettingCase> cases = {
        {"allowSmartCard", 1, true},      {"UserPairing", 1, true},
        {"oneCardPerUser", 0, true},      {"checkCertificateTrust", 0, true},
        {"useLocalOd", 0, true},          {"enforceSmartCard", 0, true},
        {"allowUnmappedUsers", 0, false}, {"anyOtherKey", 0, true},
        {"tokenRemovalAction", 0, true},
    };
    return cases;
}

struct ExpectedSetting {
    std::int32_t value;
    SmartcardSettingOrigin origin;
};

// The user's own record has no say.
inline ExpectedSetting expectedSetting(const SettingCase& setting, const StoredCase& managed,
                                       const StoredCase& machine) {
    const bool forced = setting.managementCounts && managed.value;
    const auto number = forced ? managed.number : machine.number;
    if (!number) return {setting.defaultValue, SmartcardSettingOrigin::Default};
    return {*number, forced ? SmartcardSettingOrigin::Managed : SmartcardSettingOrigin::Machine};
}

}  // namespace vlm
