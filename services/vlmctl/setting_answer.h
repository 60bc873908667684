// What a setting is now, and why: for the machine, or for one user.
//
// In tests: tests/unit/vlmctl/settings_command_test.cpp

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "services/vlmctl/json.h"

namespace vlm::control {

struct SettingAnswer {
    std::string key;
    std::int32_t value = 0;
    std::string origin;  // "managed", "machine" or "default"
    std::string why;     // in words, beginning with the origin; empty when no user was named
};

// Asks libvlm, as every login does.
SettingAnswer answerFor(std::string_view key, const std::optional<std::string>& user);

Json::Object jsonOf(const SettingAnswer& answer);

}  // namespace vlm::control
