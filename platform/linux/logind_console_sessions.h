// The sessions of systemd-logind, as it publishes them in files below /run/systemd.
//
// On console is a user's session (no login screen, no background service) that is the active one
// of the seat seat0. Sessions are told apart in age by their ids, which logind counts up.

#pragma once

#include "platform/console_sessions.h"

namespace vlm::platform {

class LogindConsoleSessions final : public ConsoleSessions {
public:
    std::optional<std::vector<ConsoleSession>> sessions() const override;
};

}  // namespace vlm::platform
