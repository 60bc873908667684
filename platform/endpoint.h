// Endpoint: one end of a channel that a service hands to its client.
//
// Ownership: shared by the endpoint's copies; the descriptor is closed when the last one is gone.
// Threads:   a value; distinct values are independent.
// Errors:    an endpoint without a descriptor leads nowhere; no service hands out such a one.
// In tests:  tests/unit/platform/message_test.cpp

#pragma once

#include <memory>

namespace vlm::platform {

struct Endpoint {
    std::shared_ptr<const int> descriptor;
    bool operator==(const Endpoint&) const = default;
};

}  // namespace vlm::platform
