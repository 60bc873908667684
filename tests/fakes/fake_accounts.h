#pragma once

#include <map>

#include "platform/accounts.h"

namespace vlm::fakes {

class FakeAccounts final : public platform::Accounts {
public:
    // What a test does to the world.
    void add(const std::string& name, platform::UserId id) {
        _idByName[name] = id;
        _nameById[id] = name;
    }

    std::optional<platform::UserId> userId(const std::string& userName) const override {
        const auto found = _idByName.find(userName);
        if (found == _idByName.end()) return std::nullopt;
        return found->second;
    }

    std::optional<std::string> userName(platform::UserId userId) const override {
        const auto found = _nameById.find(userId);
        if (found == _nameById.end() || found->second.empty()) return std::nullopt;
        return found->second;
    }

private:
    std::map<std::string, platform::UserId> _idByName;
    std::map<platform::UserId, std::string> _nameById;
};

}  // namespace vlm::fakes
