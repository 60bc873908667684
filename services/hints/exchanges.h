// Exchanges: what answers the requests that come in from a bus.
//
// Shapes:    platform/message.h; the keys and codes are in README.md.
// Threads:   the event loop's.
// Blocking:  never for a card or a person; the answer comes when it is there.
// Errors:    every refusal is a reply, with a status in "res" and an error entry.
// Behind it: services/hints/hints_service.h (daemon), services/hints/forwarding_service.h (user)

#pragma once

#include <functional>
#include <string>
#include <vector>

#include "platform/message.h"
#include "services/hints/caller.h"

namespace vlm::service {

// A request as it was read from the bus.
struct IncomingRequest {
    platform::Message message;
    std::vector<std::string> unreadableKeys;  // there, but twice or of a type that is not ours
};

using Reply = std::function<void(platform::Message)>;

class Exchanges {
public:
    virtual ~Exchanges() = default;

    // Calls `reply` at most once, now or later; not at all for a caller that left meanwhile.
    virtual void handle(const Caller& caller, const IncomingRequest& request, Reply reply) = 0;
};

}  // namespace vlm::service
