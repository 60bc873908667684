#include "settings/smartcard_settings.h"

#include "hints/hints_client.h"
#include "hints/hints_log.h"
#include "settings/smartcard_configuration.h"
#include "settings/smartcard_settings_worker.h"

using vlm::hints::log;
using vlm::platform::String;

std::int32_t VLGetSmartcardSetting(const String& key) {
    log().info("VLGetSmartcardSetting {}", key);
    const std::int32_t value = VLGetSmartcardSettingWorker(key);
    log().info("Returning value {}", value);
    return value;
}

std::int32_t VLGetSmartcardSettingForUser(const String& key,
                                          const std::optional<String>& userName) {
    return vlm::settingForUser(key, userName, vlm::kSmartcardConfiguration, VLIsUserBound);
}

vlm::SmartcardSettingOrigin VLGetSmartcardSettingOrigin(const String& key) {
    return vlm::resolveSetting(key).origin;
}
