// UserSessions: the sessions of this process's user, and what can be done to them.
//
// Threads:   the event loop's. Blocking: no; what is asked for is done a moment later.
// Errors:    one log line.
// Behind it: services/hints/logind_user_sessions.h
// In tests:  tests/unit/services/removal_action_test.cpp, tests/lab/scenarios/removal.py

#pragma once

#include <string>
#include <vector>

namespace vlm::service {

class UserSessions {
public:
    virtual ~UserSessions() = default;

    virtual std::vector<std::string> ids() const = 0;
    virtual void lock(const std::string& id) = 0;
    virtual void end(const std::string& id) = 0;
};

}  // namespace vlm::service
