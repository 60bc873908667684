#include "services/vlmctl/setting_answer.h"

#include "hints/hints_client.h"
#include "platform/text.h"
#include "services/vlmctl/known_key.h"
#include "settings/smartcard_configuration.h"
#include "settings/smartcard_settings.h"

namespace vlm::control {

namespace {

using platform::String;
using platform::text;

constexpr std::string_view kDecidedPerUser = "enforceSmartCard";
constexpr std::string_view kUnmappedUsers = "allowUnmappedUsers";

std::string nameOf(SmartcardSettingOrigin origin) {
    switch (origin) {
        case SmartcardSettingOrigin::Managed:
            return "managed";
        case SmartcardSettingOrigin::Machine:
            return "machine";
        case SmartcardSettingOrigin::Default:
            return "default";
    }
    return "unknown";
}

bool configurationMapsUsers() {
    const auto configuration = copySmartCardConfiguration();
    return configuration && configuration->contains(kAttributeMapping);
}

// Only a machine that enforces cards and lets some in without asks who the user is.
std::string reasonOf(const std::string& user, std::int32_t value) {
    if (VLGetSmartcardSetting(String(kUnmappedUsers)) == 0)
        return text("{} is off", kUnmappedUsers);
    if (value == 0) return text("{} is not paired and {} is on", user, kUnmappedUsers);
    if (configurationMapsUsers())
        return text("{} in {} maps users to cards", kAttributeMapping, kSmartcardConfiguration);
    const auto pairings = VLCopyLegacyBindings(String(user), /*flag=*/false);
    if (!pairings) return text("the hints service gave no answer, so {} counts as paired", user);
    return text("{} is paired", user);
}

}  // namespace

SettingAnswer answerFor(std::string_view key, const std::optional<std::string>& user) {
    const String name(key);
    SettingAnswer answer{std::string(key),
                         VLGetSmartcardSetting(name),
                         nameOf(VLGetSmartcardSettingOrigin(name)),
                         {}};
    if (!user) return answer;

    const bool isDecidedByUser = key == kDecidedPerUser && answer.value != 0;
    answer.value = VLGetSmartcardSettingForUser(name, String(*user));
    answer.why = answer.origin;
    if (isDecidedByUser) answer.why += "; " + reasonOf(*user, answer.value);
    return answer;
}

Json::Object jsonOf(const SettingAnswer& answer) {
    Json::Object object{{"key", answer.key}, {"value", answer.value}, {"origin", answer.origin}};
    if (!answer.why.empty()) object.push_back({"why", answer.why});
    return object;
}

}  // namespace vlm::control
