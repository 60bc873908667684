// What the exported settings functions share: the resolution, and the rule for one user.

#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <string_view>

#include "platform/property_list.h"
#include "platform/string.h"
#include "settings/smartcard_settings.h"

namespace vlm {

// The value as a setting's number; none when it is neither a boolean nor a number.
std::optional<std::int32_t> settingNumber(const platform::PropertyList& value);

struct ResolvedSetting {
    std::int32_t value = 0;
    SmartcardSettingOrigin origin = SmartcardSettingOrigin::Default;
};

ResolvedSetting resolveSetting(const platform::String& key);

// Likewise, without a line in the log: for who asks again and again.
std::int32_t settingNow(std::string_view key);

// Whether the user is paired with a card, as far as who asks can tell.
using IsUserBound = std::function<bool(const std::optional<platform::String>& userName)>;

// VLGetSmartcardSettingForUser() with the configuration file at this path, for programs that must
// not ask the hints service, or are it.
std::int32_t settingForUser(const platform::String& key,
                            const std::optional<platform::String>& userName,
                            const std::filesystem::path& configurationFile,
                            const IsUserBound& isUserBound);

}  // namespace vlm

// The resolution without the rule for one user.
std::int32_t VLGetSmartcardSettingWorker(const vlm::platform::String& key);
