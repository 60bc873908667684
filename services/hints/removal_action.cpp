#include "services/hints/removal_action.h"

#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

// The numbers of the setting; any other stands for nothing to be done.
constexpr std::int32_t kLock = 1;
constexpr std::int32_t kLogOut = 2;

}  // namespace

void RemovalAction::cardRemoved(const std::string& token) {
    const auto action = _parts.setting();
    if (action != kLock && action != kLogOut) return;
    for (const auto& session : _parts.sessions.ids()) {
        if (_parts.cards.tokenOf(session) != token) continue;
        kLog.notice("the card was removed with which session {} was logged in; {}", session,
                    action == kLock ? "locking it" : "logging it out");
        if (action == kLock)
            _parts.sessions.lock(session);
        else
            _parts.sessions.end(session);
    }
}

}  // namespace vlm::service
