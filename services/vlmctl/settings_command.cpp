// What is set, and why.

#include <optional>
#include <string>

#include "platform/accounts.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"
#include "services/vlmctl/known_key.h"
#include "services/vlmctl/setting_answer.h"
#include "services/vlmctl/table.h"
#include "settings/known_settings.h"

namespace vlm::control {

namespace {

using platform::text;

std::string heading(const std::optional<std::string>& user) { return user ? "WHY" : "ORIGIN"; }

// A user of whom the machine knows nothing has no answer of their own.
bool knowsUser(const std::optional<std::string>& user, Output& output) {
    if (!user || platform::current().accounts().userId(*user)) return true;
    output.complain(text("there is no account \"{}\"", *user));
    return false;
}

}  // namespace

int listSettings(const Arguments& arguments, Output& output) {
    const auto& user = arguments.user;
    if (!knowsUser(user, output)) return kExitFailure;

    Table table({"KEY", "VALUE", heading(user)});
    Json::Array list;
    for (const auto& setting : kKnownSettings) {
        const auto answer = answerFor(setting.key, user);
        table.add({std::string(setting.key), std::to_string(answer.value),
                   answer.why.empty() ? answer.origin : answer.why});
        list.emplace_back(jsonOf(answer));
    }
    if (!arguments.json) {
        table.print(output, arguments.legend, "");
        return kExitSuccess;
    }
    Json::Object document;
    if (user) document.push_back({"user", *user});
    document.push_back({"settings", std::move(list)});
    output.print(Json(std::move(document)).text());
    return kExitSuccess;
}

int getSetting(const Arguments& arguments, Output& output) {
    const auto& key = arguments.operands.front();
    if (!findSetting(key)) {
        output.complain(unknownKey(key));
        return kExitFailure;
    }
    if (!knowsUser(arguments.user, output)) return kExitFailure;

    const auto answer = answerFor(key, arguments.user);
    output.print(arguments.json ? Json(jsonOf(answer)).text() : std::to_string(answer.value));
    return kExitSuccess;
}

}  // namespace vlm::control
