#pragma once

#include <string>
#include <vector>

#include "platform/notifications.h"

namespace vlm::fakes {

class FakeNotifications final : public platform::Notifications {
public:
    void post(std::string_view name) override { posted.emplace_back(name); }

    std::vector<std::string> posted;
};

}  // namespace vlm::fakes
