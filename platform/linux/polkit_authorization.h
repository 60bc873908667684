// polkit as the authority on rights: a right is an action, and resources/polkit declares it.
//
// A session is a connection of its own to the system bus, and what polkit is asked about is whoever
// has that connection. So nobody can be mistaken for this process, and polkit takes its question
// off the screen when the session goes.
//
// Statuses: a question that the person dismissed is kAuthorizationCanceled; one that could be
// answered only by a person who cannot be asked, since nothing on the desktop asks for polkit or
// the flags forbid it, is kInteractionNotAllowed; any other no is kAuthorizationDenied. What is no
// answer of polkit's, also for a right that it does not know, is kAuthorizationFailed.

#pragma once

#include <chrono>

#include "platform/authorization.h"

namespace vlm::platform {

class PolkitAuthorization final : public Authorization {
public:
    // For the person to find the administrator who types a password; nobody is left with a window
    // that waits for ever.
    static constexpr std::chrono::minutes kPatience{30};

    explicit PolkitAuthorization(std::chrono::microseconds patience = kPatience)
        : _patience(patience) {}

    CreatedAuthorizationSession createSession() override;

private:
    const std::chrono::microseconds _patience;
};

}  // namespace vlm::platform
