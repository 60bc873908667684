// ConsoleWatch: whether this instance's user is at the console, and when that changes.
//
// Ownership: the loop outlives it. Threads: the event loop's.
// Blocking:  no; reads what logind has published, which also tells of each change.
// Errors:    where no session manager runs, nobody can be elsewhere: the user is at the console.
// In tests:  tests/integration/service/session_tokens_test.cpp, tests/lab/scenarios/new_token.py

#pragma once

#include <systemd/sd-event.h>
#include <systemd/sd-login.h>

#include <functional>
#include <memory>

#include "services/hints/tokens/event_source.h"

namespace vlm::service {

// Whether the user of this process is.
bool isUserAtConsole();

class ConsoleWatch {
public:
    ConsoleWatch(sd_event* event, std::function<void()> changed);

    ConsoleWatch(const ConsoleWatch&) = delete;
    ConsoleWatch& operator=(const ConsoleWatch&) = delete;

private:
    struct MonitorUnref {
        void operator()(sd_login_monitor* monitor) const { sd_login_monitor_unref(monitor); }
    };

    void sessionsChanged();

    const std::function<void()> _changed;
    std::unique_ptr<sd_login_monitor, MonitorUnref> _monitor;
    bool _wasAtConsole = false;
    EventSource _sessionsChanged;
};

}  // namespace vlm::service
