// A program that asks the real platform one question and prints the answer, so that tests can put
// it into a world of their making: another user, other files, another environment.

#include <sys/prctl.h>
#include <unistd.h>

#include <cstdlib>
#include <iostream>
#include <map>
#include <string>
#include <vector>

#include "platform/accounts.h"
#include "platform/authorization.h"
#include "platform/console_sessions.h"
#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/system_log.h"
#include "tests/integration/linux/probe.h"

namespace {

using namespace vlm::platform;
using Arguments = std::vector<std::string>;

UserId number(const std::string& text) {
    return static_cast<UserId>(std::strtoul(text.c_str(), nullptr, 10));
}

int sessions(const Arguments&) {
    const auto sessions = current().consoleSessions().sessions();
    if (!sessions) return vlm::test::kProbeAnswersNone;
    for (const auto& session : *sessions)
        std::cout << session.userId << (session.onConsole ? " console\n" : " away\n");
    return 0;
}

int userId(const Arguments& arguments) {
    const auto id = current().accounts().userId(arguments.at(0));
    if (!id) return vlm::test::kProbeAnswersNone;
    std::cout << *id;
    return 0;
}

int userName(const Arguments& arguments) {
    const auto name = current().accounts().userName(number(arguments.at(0)));
    if (!name) return vlm::test::kProbeAnswersNone;
    std::cout << *name;
    return 0;
}

int process(const Arguments& arguments) {
    const UserId effective = number(arguments.at(1));
    if (::setresuid(number(arguments.at(0)), effective, 0) != 0) return 1;
    auto& info = current().processInfo();
    std::cout << info.realUserId() << '\n'
              << info.effectiveUserId() << '\n'
              << info.ownerUserName();
    // A leak checker cannot look into a process that is half one user's and half another's.
    if (::setresuid(0, 0, 0) != 0 || ::prctl(PR_SET_DUMPABLE, 1) != 0) return 1;
    return 0;
}

int collects(const Arguments& arguments) {
    const auto level = static_cast<LogLevel>(number(arguments.at(0)));
    return current().systemLog().collects(level) ? 0 : vlm::test::kProbeAnswersNone;
}

int log(const Arguments& arguments) {
    current().systemLog().write({arguments.at(0), arguments.at(1),
                                 static_cast<LogLevel>(number(arguments.at(2))), arguments.at(3),
                                 arguments.at(4)});
    return 0;
}

int authorize(const Arguments& arguments) {
    auto created = current().authorization().createSession();
    if (created.session)
        created.status = created.session->request(
            arguments.at(0), {.interactionAllowed = true, .extendRights = true});
    std::cout << created.status;
    return 0;
}

int text(const Arguments& arguments) {
    std::cout << current().localization().text(arguments.at(0));
    return 0;
}

}  // namespace

int main(int argc, char* argv[]) {
    const std::map<std::string, int (*)(const Arguments&)> questions{
        {"sessions", sessions}, {"user-id", userId},     {"user-name", userName},
        {"process", process},   {"collects", collects},  {"log", log},
        {"text", text},         {"authorize", authorize}};
    const Arguments arguments(argv + 1, argv + argc);
    const auto question = questions.find(arguments.at(0));
    if (question == questions.end()) return 1;
    return question->second({arguments.begin() + 1, arguments.end()});
}
