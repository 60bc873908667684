// Prints who is at the machine, as the tool sees it: the name of the user at the console or
// "nobody", then a line for each session, "NAME console" or "NAME away".

#include <iostream>

#include "platform/accounts.h"
#include "platform/console_sessions.h"
#include "platform/platform.h"
#include "util/bind_utils.h"

int main() {
    using vlm::BindUtils;
    const auto name = [](vlm::platform::UserId user) {
        return BindUtils::userNameForUserId(user).value_or("nobody");
    };
    std::cout << name(BindUtils::currentLoggedInUserId()) << '\n';
    const auto sessions = vlm::platform::current().consoleSessions().sessions();
    if (!sessions) return 1;
    for (const auto& session : *sessions)
        std::cout << name(session.userId) << (session.onConsole ? " console\n" : " away\n");
}
