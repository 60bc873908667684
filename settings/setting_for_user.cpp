#include "hints/hints_log.h"
#include "settings/smartcard_configuration.h"
#include "settings/smartcard_settings_worker.h"

namespace vlm {

using hints::log;
using platform::String;

namespace {

// Whether certificates are mapped to accounts by what they say, so that users need no pairing.
bool attributesAreMapped(const std::filesystem::path& configurationFile) {
    const auto configuration = copySmartCardConfiguration(configurationFile);
    return configuration && configuration->contains("AttributeMapping");
}

bool unmappedUsersAreAllowed() { return VLGetSmartcardSettingWorker("allowUnmappedUsers") != 0; }

}  // namespace

std::int32_t settingForUser(const String& key, const std::optional<String>& userName,
                            const std::filesystem::path& configurationFile,
                            const IsUserBound& isUserBound) {
    log().info("VLGetSmartcardSettingForUser {}, {}", key, userName);
    if (!userName) log().info("No username was provided {}, {}", key, userName);

    std::int32_t value = VLGetSmartcardSettingWorker(key);
    // Who may log in without a card must not be locked out by a card that was never paired.
    if (value != 0 && key == "enforceSmartCard" && unmappedUsersAreAllowed() &&
        !attributesAreMapped(configurationFile) && !isUserBound(userName))
        value = 0;

    log().info("Returning value {}", value);
    return value;
}

}  // namespace vlm
