#pragma once

#include "platform/process_info.h"

namespace vlm::fakes {

class FakeProcessInfo final : public platform::ProcessInfo {
public:
    // What a test does to the world: an ordinary process of one user, or a set-user-id one.
    void runAs(platform::UserId user, const std::string& name = "") {
        _realUserId = _effectiveUserId = user;
        _owner = name.empty() ? std::to_string(user) : name;
    }
    void runSetUserId(platform::UserId real, platform::UserId effective) {
        runAs(effective);
        _realUserId = real;
    }

    platform::UserId realUserId() const override { return _realUserId; }
    platform::UserId effectiveUserId() const override { return _effectiveUserId; }
    std::string ownerUserName() const override { return _owner; }

private:
    platform::UserId _realUserId = 1000;
    platform::UserId _effectiveUserId = 1000;
    std::string _owner = "alice";
};

}  // namespace vlm::fakes
