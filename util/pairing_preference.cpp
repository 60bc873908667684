// The two switches of the pairing dialog.

#include <string_view>

#include "platform/platform.h"
#include "platform/preferences.h"
#include "settings/known_settings.h"
#include "settings/smartcard_settings.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::PreferencesUser;

namespace {

constexpr const char* kPairingPreference = "UserPairing";

// What the write did shows in the synchronisation alone.
bool setPairingPreference(bool value, PreferencesUser user) {
    auto& preferences = platform::current().preferences();
    preferences.setValue(kPairingPreference, value, kSmartcardDomain, user);
    return preferences.synchronise(kSmartcardDomain, user);
}

}  // namespace

bool BindUtils::setBindEnabled(bool enabled) {
    const bool result = setPairingPreference(enabled, PreferencesUser::Any);
    log().notice("set UserPairing enabled: {}, result: {}", enabled, result);
    return result;
}

bool BindUtils::isBindEnabled() {
    const bool enabled = VLGetSmartcardSetting(kPairingPreference) != 0;
    log().debug("enabled: {}", enabled);
    return enabled;
}

bool BindUtils::setBindAllowed(bool allowed) {
    const bool result = setPairingPreference(allowed, PreferencesUser::Current);
    log().notice("set UserPairing allowed: {}, result: {}", allowed, result);
    return result;
}

bool BindUtils::isBindAllowed() {
    const auto own = platform::current().preferences().value(kPairingPreference, kSmartcardDomain,
                                                             PreferencesUser::Current);
    const bool allowed = own ? own->boolean().value_or(true) : true;
    log().debug("allowed: {}", allowed);
    return allowed;
}

}  // namespace vlm
