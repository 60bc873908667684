// Anchors: the issuers that the machine itself trusts.
//
// Threads:   the event loop's; the answer is called there, exactly once, never before the asking
//            call has returned. Those that are missing at the end of this object's life do not
//            come.
// Blocking:  never.
// Errors:    a trust module that fails is a line in the log, and holds nothing.
// Behind it: services/hints/tokens/worker_anchors.h
// In tests:  tests/fakes/fake_anchors.h, tests/integration/tokens/

#pragma once

#include <functional>

#include "services/hints/tokens/machine_anchors.h"

namespace vlm::service {

class Anchors {
public:
    virtual ~Anchors() = default;

    virtual void read(std::function<void(const MachineAnchors&)> answer) = 0;
};

}  // namespace vlm::service
