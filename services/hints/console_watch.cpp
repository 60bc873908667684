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

ConsoleWatch::ConsoleWatch(sd_event* event, std::function<void()> changed) {
    sd_login_monitor* made = nullptr;
    // It publishes nothing to be watched where it does not run.
    if (sd_login_monitor_new("session", &made) < 0) return;
    _monitor.reset(made);
    _changed = callWhenReadable(event, sd_login_monitor_get_fd(made),
                                [made, changed = std::move(changed)] {
                                    sd_login_monitor_flush(made);
                                    changed();
                                });
}

}  // namespace vlm::service
