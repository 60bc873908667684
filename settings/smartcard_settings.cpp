#include "settings/smartcard_settings.h"

#include <algorithm>
#include <array>
#include <string>
#include <string_view>

#include "hints/hints_connection.h"

using vlm::hints::log;
using vlm::platform::String;

namespace {

// A machine where nobody has decided anything lets people use their cards.
constexpr std::array<std::string_view, 2> kOnByDefault = {"allowSmartCard", "UserPairing"};

std::int32_t defaultValue(const std::string& key) {
    return std::ranges::find(kOnByDefault, key) != kOnByDefault.end() ? 1 : 0;
}

}  // namespace

std::int32_t VLGetSmartcardSetting(const String& key) {
    log().info("VLGetSmartcardSetting {}", key);
    log().info("Using default value");
    const std::int32_t value = defaultValue(key.utf8());
    log().info("Returning value {}", value);
    return value;
}
