#include "settings/smartcard_settings_worker.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <string>

#include "hints/hints_log.h"
#include "platform/platform.h"
#include "platform/preferences.h"
#include "settings/known_settings.h"

namespace vlm {

using hints::log;
using platform::PreferencesUser;
using platform::PropertyList;
using platform::String;

namespace {

KnownSetting ruleOf(std::string_view key) {
    const auto* known = std::ranges::find(kKnownSettings, key, &KnownSetting::key);
    if (known != kKnownSettings.end()) return *known;
    return {key, /*defaultValue=*/0, /*obeysManagement=*/true};
}

// A conversion of a number that does not fit would be undefined.
std::int32_t nearestNumber(double real) {
    using Limits = std::numeric_limits<std::int32_t>;
    if (std::isnan(real)) return 0;
    return static_cast<std::int32_t>(
        std::clamp(real, double{Limits::min()}, double{Limits::max()}));
}

std::optional<PropertyList> storedValue(const std::string& key, bool forced) {
    auto& preferences = platform::current().preferences();
    if (forced) return preferences.applicationValue(key, kSmartcardDomain);
    return preferences.value(key, kSmartcardDomain, PreferencesUser::Any);
}

bool isForced(const KnownSetting& rule) {
    return rule.obeysManagement &&
           platform::current().preferences().isForced(rule.key, kSmartcardDomain);
}

std::optional<std::int32_t> storedNumber(const std::string& key, bool forced) {
    const auto stored = storedValue(key, forced);
    return stored ? settingNumber(*stored) : std::nullopt;
}

}  // namespace

std::optional<std::int32_t> settingNumber(const PropertyList& value) {
    if (const auto boolean = value.boolean()) return *boolean ? 1 : 0;
    if (const auto integer = value.integer()) return static_cast<std::int32_t>(*integer);
    if (const auto large = value.unsignedInteger()) return static_cast<std::int32_t>(*large);
    if (const auto real = value.real()) return nearestNumber(*real);
    return std::nullopt;
}

ResolvedSetting resolveSetting(const String& givenKey) {
    const std::string key = givenKey.utf8();
    const KnownSetting rule = ruleOf(key);
    const bool forced = isForced(rule);
    log().info(forced ? "Using MDM prefs" : "Using system prefs");

    if (const auto number = storedNumber(key, forced))
        return {*number,
                forced ? SmartcardSettingOrigin::Managed : SmartcardSettingOrigin::Machine};

    log().info("Using default value");
    return {rule.defaultValue, SmartcardSettingOrigin::Default};
}

std::int32_t settingNow(std::string_view key) {
    const KnownSetting rule = ruleOf(key);
    return storedNumber(std::string(key), isForced(rule)).value_or(rule.defaultValue);
}

}  // namespace vlm

std::int32_t VLGetSmartcardSettingWorker(const vlm::platform::String& key) {
    return vlm::resolveSetting(key).value;
}
