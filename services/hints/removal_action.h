// RemovalAction: what becomes of a session when the card is pulled with which it was logged in: the
// setting "tokenRemovalAction" says it. Other cards, and sessions that were logged in without a
// card, are no concern of it.
//
// Ownership: what its parts refer to outlives it. Threads: the event loop's.
// Blocking:  for files in memory. Errors: none.
// In tests:  tests/unit/services/removal_action_test.cpp

#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <utility>

#include "services/hints/session_cards.h"
#include "services/hints/user_sessions.h"

namespace vlm::service {

class RemovalAction {
public:
    struct Parts {
        const SessionCards& cards;
        UserSessions& sessions;
        std::function<std::int32_t()> setting;
    };

    explicit RemovalAction(Parts parts) : _parts(std::move(parts)) {}

    void cardRemoved(const std::string& token);

private:
    Parts _parts;
};

}  // namespace vlm::service
