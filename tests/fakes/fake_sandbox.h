#pragma once

#include <utility>

#include "platform/sandbox.h"

namespace vlm::fakes {

class FakeSandbox final : public platform::Sandbox {
public:
    struct Entered {
        std::string profile;
        std::vector<std::pair<std::string, std::string>> parameters;
    };

    // What a test does to the world.
    platform::FolderAnswer temporaryFolder{"/tmp", 0};
    platform::FolderAnswer cacheFolder{"/tmp", 0};
    platform::SandboxAnswer answer;

    // What happened.
    std::vector<Entered> entered;

    platform::FolderAnswer userTemporaryFolder() override { return temporaryFolder; }
    platform::FolderAnswer userCacheFolder() override { return cacheFolder; }

    platform::SandboxAnswer enter(
        std::string_view profileName,
        const std::vector<platform::SandboxParameter>& parameters) override {
        Entered record{std::string(profileName), {}};
        for (const auto& each : parameters) record.parameters.emplace_back(each.name, each.value);
        entered.push_back(std::move(record));
        return answer;
    }
};

}  // namespace vlm::fakes
