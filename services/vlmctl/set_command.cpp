// Changes of this machine's own record.

#include <algorithm>
#include <array>
#include <cctype>
#include <optional>
#include <span>
#include <string>

#include "platform/platform.h"
#include "platform/preferences.h"
#include "platform/process_info.h"
#include "platform/text.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"
#include "services/vlmctl/known_key.h"
#include "services/vlmctl/setting_answer.h"
#include "settings/known_settings.h"

namespace vlm::control {

namespace {

using platform::PreferencesUser;
using platform::PropertyList;
using platform::text;

struct Word {
    std::string_view name;
    bool value;
};

constexpr std::array kWords = {
    Word{"true", true},   Word{"yes", true}, Word{"on", true},   Word{"1", true},
    Word{"false", false}, Word{"no", false}, Word{"off", false}, Word{"0", false},
};

std::string inLowerCase(std::string word) {
    std::ranges::transform(word, word.begin(), [](unsigned char letter) {
        return static_cast<char>(std::tolower(letter));
    });
    return word;
}

std::optional<PropertyList> switchOf(const std::string& word) {
    const auto found = std::ranges::find(kWords, word, &Word::name);
    if (found == kWords.end()) return std::nullopt;
    return PropertyList(found->value);
}

// The number of one of the choices, by its name or as it is.
std::optional<PropertyList> choiceOf(std::span<const std::string_view> choices,
                                     const std::string& word) {
    for (std::size_t number = 0; number < choices.size(); ++number)
        if (word == choices[number] || word == std::to_string(number))
            return PropertyList(static_cast<std::int64_t>(number));
    return std::nullopt;
}

std::optional<PropertyList> valueFor(const KnownSetting& setting, const std::string& word) {
    return setting.choices.empty() ? switchOf(inLowerCase(word))
                                   : choiceOf(setting.choices, inLowerCase(word));
}

std::string notAValue(const KnownSetting& setting, const std::string& word) {
    if (setting.choices.empty())
        return text("{} is on or off; \"{}\" is neither", setting.key, word);
    std::string names;
    for (const auto choice : setting.choices)
        names.append(names.empty() ? "" : ", ").append(choice);
    return text("{} is one of {}; \"{}\" is none of them", setting.key, names, word);
}

// Why the key may not be changed here; none when it may.
std::optional<std::string> refusalOf(const std::string& key) {
    const auto* setting = findSetting(key);
    if (!setting) return unknownKey(key);
    auto& platform = platform::current();
    if (platform.processInfo().effectiveUserId() != 0)
        return text("{} is a setting of the whole machine; only root may change it", key);
    if (setting->obeysManagement && platform.preferences().isForced(key, kSmartcardDomain))
        return text(
            "{} is managed; a value of this machine's own would not count, and none is "
            "written",
            key);
    return std::nullopt;
}

int change(const Arguments& arguments, const std::optional<PropertyList>& value, Output& output) {
    const auto& key = arguments.operands.front();
    auto& preferences = platform::current().preferences();
    preferences.setValue(key, value, kSmartcardDomain, PreferencesUser::Any);
    if (!preferences.synchronise(kSmartcardDomain, PreferencesUser::Any)) {
        output.complain(
            text("{} could not be written; \"journalctl SUBSYSTEM=org.vlm.token\" says "
                 "why",
                 key));
        return kExitFailure;
    }
    if (arguments.json) output.print(Json(jsonOf(answerFor(key, std::nullopt))).text());
    return kExitSuccess;
}

int refuse(const std::string& why, Output& output) {
    output.complain(why);
    return kExitFailure;
}

}  // namespace

int setSetting(const Arguments& arguments, Output& output) {
    const auto& key = arguments.operands[0];
    const auto& word = arguments.operands[1];
    const auto* setting = findSetting(key);
    const auto value = setting ? valueFor(*setting, word) : std::nullopt;
    if (setting && !value) return refuse(notAValue(*setting, word), output);
    if (const auto why = refusalOf(key)) return refuse(*why, output);
    return change(arguments, value, output);
}

int unsetSetting(const Arguments& arguments, Output& output) {
    if (const auto why = refusalOf(arguments.operands.front())) return refuse(*why, output);
    return change(arguments, std::nullopt, output);
}

}  // namespace vlm::control
