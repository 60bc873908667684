#pragma once

#include <functional>
#include <utility>
#include <vector>

#include "services/hints/anchors.h"

namespace vlm::fakes {

// Anchors that are told when the test lets them.
class FakeAnchors final : public service::Anchors {
public:
    service::MachineAnchors anchors;
    int readings = 0;

    void settle() {
        for (const auto& asker : std::exchange(_askers, {})) asker(anchors);
    }

    // Anchors:
    void read(std::function<void(const service::MachineAnchors&)> answer) override {
        ++readings;
        _askers.push_back(std::move(answer));
    }

private:
    std::vector<std::function<void(const service::MachineAnchors&)>> _askers;
};

}  // namespace vlm::fakes
