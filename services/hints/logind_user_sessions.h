// LogindUserSessions: what logind publishes of the user's sessions, and does to them when it is
// asked on the system bus.

#pragma once

#include <systemd/sd-bus.h>

#include <string>
#include <vector>

#include "services/hints/user_sessions.h"

namespace vlm::service {

class LogindUserSessions final : public UserSessions {
public:
    // The connection outlives this; without one nothing can be done.
    explicit LogindUserSessions(sd_bus* systemBus) : _bus(systemBus) {}

    std::vector<std::string> ids() const override;
    void lock(const std::string& id) override { call("LockSession", id); }
    void end(const std::string& id) override { call("TerminateSession", id); }

private:
    void call(const char* method, const std::string& id);

    sd_bus* _bus;
};

}  // namespace vlm::service
