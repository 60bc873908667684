#pragma once

#include <string_view>

namespace vlm::control {

// The file that says how the names on cards map to accounts, and its entry that does.
inline constexpr const char* kConfigurationFile = "/etc/SmartcardLogin.plist";
inline constexpr std::string_view kAttributeMapping = "AttributeMapping";

// Whether the configuration file has that entry, as the settings read it.
bool configurationMapsUsers();

}  // namespace vlm::control
