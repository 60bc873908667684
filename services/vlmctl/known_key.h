#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "settings/known_settings.h"

namespace vlm::control {

// The entry of the configuration file that is read, of any type.
inline constexpr std::string_view kAttributeMapping = "AttributeMapping";

// The setting with exactly this key; null when there is none.
const KnownSetting* findSetting(std::string_view key);

// The known key that was probably meant, among the settings and the configuration file's entries;
// none when nothing known is like it.
std::optional<std::string_view> nearestKey(std::string_view key);

// Why the key is not taken, with what was probably meant.
std::string unknownKey(std::string_view key);

}  // namespace vlm::control
