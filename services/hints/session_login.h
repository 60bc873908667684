// SessionLogin: noting which card has opened a session, so that its removal can close or lock it.
//
// Root's programs tell it. The session must be there: what is gone already needs no note, and those
// that ended since the last note are forgotten.
//
// Threads:  one. Blocking: for a file system in memory.
// Errors:   a refusal.
// In tests: tests/unit/services/session_login_test.cpp

#pragma once

#include <functional>
#include <optional>
#include <string>

#include "services/hints/outcome.h"
#include "services/hints/request.h"
#include "services/hints/session_cards.h"

namespace vlm::service {

struct SessionLogin {
    const SessionCards& cards;
    std::function<bool(const std::string& session)> isThere;

    std::optional<Refusal> note(const Request& request) const;
};

}  // namespace vlm::service
