// The smart-card settings, for programs.
//
// Shapes:   a setting is a signed 32-bit whole number; switches are 1 and 0. Keys are
//           case-sensitive.
// Sources:  what management forces; else what is set for this machine; else the built-in default.
//           A user's own preferences never count. Management does not decide "allowUnmappedUsers".
// Values:   a boolean (true is 1) or a number. Of a wider integer the low 32 bits count. A real is
//           cut toward zero; beyond 32 bits it is the nearest number that there is, and 0 when it
//           is none. Anything else counts as absent: the setting then has its default.
// Defaults: 1 for "allowSmartCard" and "UserPairing", 0 for every other key.
// Threads:  any. Nothing is kept between calls: each one answers what is set now.
// Blocking: on the file system; for one user's setting also on the hints service.
// Errors:   none; what cannot be read counts as absent.
// Log:      subsystem org.vlm.token, category ZEM.
// In tests: tests/unit/settings/, tests/integration/settings/

#pragma once

#include <cstdint>
#include <optional>

#include "platform/export.h"
#include "platform/string.h"

// The setting's value.
VLM_EXPORT std::int32_t VLGetSmartcardSetting(const vlm::platform::String& key);

// The setting's value for one user, which differs for "enforceSmartCard" only. Where
// "allowUnmappedUsers" is on, that one holds for users who are paired with a card, and for
// everybody when the property list /etc/SmartcardLogin.plist has an entry "AttributeMapping". A
// user counts as paired while the hints service gives no answer, and as not paired without a name.
VLM_EXPORT std::int32_t VLGetSmartcardSettingForUser(
    const vlm::platform::String& key, const std::optional<vlm::platform::String>& userName);

namespace vlm {

enum class SmartcardSettingOrigin {
    Managed,  // management forces it
    Machine,  // it is set for this machine
    Default,  // neither holds a usable value
};

}  // namespace vlm

// Where the answer of VLGetSmartcardSetting() comes from.
VLM_EXPORT vlm::SmartcardSettingOrigin VLGetSmartcardSettingOrigin(
    const vlm::platform::String& key);
