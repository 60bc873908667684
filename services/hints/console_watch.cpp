#include "services/hints/console_watch.h"

#include <unistd.h>

#include <algorithm>
#include <utility>

#include "platform/console_sessions.h"
#include "platform/platform.h"

namespace vlm::service {

bool isUserAtConsole() {
    const auto sessions = platform::current().consoleSessions().sessions();
    if (!sessions) return true;
    return std::ranges::any_of(*sessions, [](const platform::ConsoleSession& session) {
        return session.onConsole && session.userId == getuid();
    });
}

ConsoleWatch::ConsoleWatch(sd_event* event, std::function<void()> changed)
    : _changed(std::move(changed)) {
    sd_login_monitor* made = nullptr;
    // It publishes nothing to be watched where it does not run.
    if (sd_login_monitor_new("session", &made) < 0) return;
    _monitor.reset(made);
    _wasAtConsole = isUserAtConsole();
    _sessionsChanged = callWhenReadable(event, sd_login_monitor_get_fd(made), [this] {
        sd_login_monitor_flush(_monitor.get());
        sessionsChanged();
    });
}

// Other users' sessions, too, are told of.
void ConsoleWatch::sessionsChanged() {
    const bool isAtConsole = isUserAtConsole();
    if (std::exchange(_wasAtConsole, isAtConsole) != isAtConsole) _changed();
}

}  // namespace vlm::service
