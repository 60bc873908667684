// Authorization: rights that an administrator can lend to whoever runs this program.
//
// A session asks for one right at a time, by its name ("org.vlm.vlmbind.admin"). For how long a
// right that was granted stays is the service's matter: the end of the session does not give it
// back.
//
// Ownership: a session belongs to whoever made it. A question that it still has open goes with it.
// Threads:   any; a session is used by one at a time.
// Blocking:  making a session waits for the way to the service. A request that may ask a person
//            waits for that person, and that can be minutes.
// Errors:    a status, 0 for success. What is neither granted nor the person's own decision is told
//            in the log as well.
// Behind it: platform/linux/polkit_authorization.h
// In tests:  tests/fakes/fake_authorization.h, tests/contracts/authorization_contract.h

#pragma once

#include <memory>
#include <string_view>

#include "platform/types.h"

namespace vlm::platform {

// Why a right was not granted. Every status but 0 is a refusal, also one that is not named here.
inline constexpr Status kAuthorizationDenied = -60005;
inline constexpr Status kAuthorizationCanceled = -60006;  // the person dismissed the question
inline constexpr Status kInteractionNotAllowed = -60007;  // nobody may be asked, or can be
inline constexpr Status kAuthorizationFailed = -60008;    // the service gave no answer

struct AuthorizationFlags {
    bool interactionAllowed = false;  // a person may be asked
    bool extendRights = false;        // the right may be obtained, and not only tested
};

class AuthorizationSession {
public:
    virtual ~AuthorizationSession() = default;

    // Asks a person only with both flags.
    virtual Status request(std::string_view right, AuthorizationFlags flags) = 0;
};

// A session, or the status that says why there is none.
struct CreatedAuthorizationSession {
    Status status = kSuccess;
    std::unique_ptr<AuthorizationSession> session;
};

class Authorization {
public:
    virtual ~Authorization() = default;

    virtual CreatedAuthorizationSession createSession() = 0;
};

}  // namespace vlm::platform
