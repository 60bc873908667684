#include "platform/linux/logind_console_sessions.h"

#include <systemd/sd-login.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>
#include <tuple>

#include "platform/platform.h"

namespace vlm::platform {

namespace {

// There as long as logind has run since the machine was started. Without it the library lists no
// sessions, just as with nobody logged in.
constexpr const char* kPublishedSessions = "/run/systemd/sessions";

struct Free {
    void operator()(char* text) const { std::free(text); }
};
using Text = std::unique_ptr<char, Free>;

std::vector<std::string> takeList(char** list) {
    std::vector<std::string> texts;
    for (char** each = list; list && *each; ++each) texts.emplace_back(Text(*each).get());
    std::free(list);
    return texts;
}

// The ids are "1", "2", ... or, for sessions that the kernel's audit does not count, "c1", "c2",
// ...: the shorter number is the smaller one.
void sortByAge(std::vector<std::string>& ids) {
    std::ranges::sort(ids, {}, [](const std::string& id) {
        const auto digits = std::min(id.find_first_of("0123456789"), id.size());
        return std::tuple(id.substr(0, digits), id.size(), id);
    });
}

bool is(int (*get)(const char* session, char** text), const std::string& id,
        std::string_view expected) {
    char* text = nullptr;
    const bool known = get(id.c_str(), &text) >= 0;
    const Text owner(text);
    return known && text && text == expected;
}

// A session stays the active one of its seat after its user has logged out, as long as a program is
// left behind in it. Its state tells.
bool isOnConsole(const std::string& id) {
    return is(sd_session_get_class, id, "user") && is(sd_session_get_seat, id, "seat0") &&
           is(sd_session_get_state, id, "active");
}

}  // namespace

std::optional<std::vector<ConsoleSession>> LogindConsoleSessions::sessions() const {
    char** list = nullptr;
    if (::access(kPublishedSessions, F_OK) != 0 || sd_get_sessions(&list) < 0) return std::nullopt;
    auto ids = takeList(list);
    sortByAge(ids);
    std::vector<ConsoleSession> sessions;
    for (const auto& id : ids) {
        uid_t user = 0;
        // A session that ended meanwhile has no user any more.
        if (sd_session_get_uid(id.c_str(), &user) >= 0)
            sessions.push_back({.onConsole = isOnConsole(id), .userId = user});
    }
    return sessions;
}

ConsoleSessions& Platform::consoleSessions() {
    static auto& service = *new LogindConsoleSessions;
    return service;
}

}  // namespace vlm::platform
