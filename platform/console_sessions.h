// ConsoleSessions: who is logged in on this machine, and who sits at it.
//
// Threads:   any; a call takes its own snapshot.
// Blocking:  no; reads what the session manager already published.
// Errors:    no session manager is not an error: sessions() is then none.
// Behind it: platform/linux/logind_console_sessions.h
// In tests:  tests/fakes/fake_console_sessions.h, tests/contracts/console_sessions_contract.h

#pragma once

#include <optional>
#include <vector>

#include "platform/types.h"

namespace vlm::platform {

struct ConsoleSession {
    bool onConsole = false;  // in the foreground of the machine's own seat
    UserId userId = 0;
};

class ConsoleSessions {
public:
    virtual ~ConsoleSessions() = default;

    // All sessions, oldest first; none when there is no session manager to ask.
    virtual std::optional<std::vector<ConsoleSession>> sessions() const = 0;
};

}  // namespace vlm::platform
