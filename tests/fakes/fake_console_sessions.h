#pragma once

#include "platform/console_sessions.h"

namespace vlm::fakes {

class FakeConsoleSessions final : public platform::ConsoleSessions {
public:
    // What a test does to the world.
    void login(platform::UserId user, bool onConsole) { _sessions.push_back({onConsole, user}); }
    void stopSessionManager() { _managerRuns = false; }

    std::optional<std::vector<platform::ConsoleSession>> sessions() const override {
        if (!_managerRuns) return std::nullopt;
        return _sessions;
    }

private:
    std::vector<platform::ConsoleSession> _sessions;
    bool _managerRuns = true;
};

}  // namespace vlm::fakes
