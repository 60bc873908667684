#pragma once

#include <string>
#include <vector>

#include "services/hints/user_sessions.h"

namespace vlm::fakes {

class FakeUserSessions final : public service::UserSessions {
public:
    std::vector<std::string> open;
    std::vector<std::string> locked;
    std::vector<std::string> ended;

    // UserSessions:
    std::vector<std::string> ids() const override { return open; }
    void lock(const std::string& id) override { locked.push_back(id); }
    void end(const std::string& id) override { ended.push_back(id); }
};

}  // namespace vlm::fakes
