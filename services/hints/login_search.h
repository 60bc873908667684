// LoginSearch: the card that a login begins with, from the request to the answer.
//
// Root asks for everybody, and without a name for whomever the inserted cards belong to. Everybody
// else asks for the own account, from a session at this machine: a screen locker does.
//
// Ownership: by a shared pointer; what comes in for a search that was dropped has no effect.
// Threads:   the event loop's. Blocking: as the policy.
// Errors:    the answer is a refusal.
// In tests:  tests/unit/services/login_search_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <vector>

#include "platform/message.h"
#include "services/hints/caller.h"
#include "services/hints/login_policy.h"
#include "services/hints/login_session.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"
#include "services/hints/tokens.h"

namespace vlm::service {

class LoginSearch : public std::enable_shared_from_this<LoginSearch> {
public:
    using Done = std::function<void(Outcome<platform::Message>)>;

    // The request is one for a card to log in with, by a caller who may ask. `done` is called once,
    // never before start() has returned.
    LoginSearch(Tokens& tokens, CallerSessions& sessions, const LoginPolicy& policy, Caller caller,
                Request request, Done done)
        : _tokens(tokens),
          _policy(policy),
          _session(sessions, std::move(caller)),
          _request(std::move(request)),
          _done(std::move(done)) {}

    void start();

private:
    void look();
    void choose(const std::vector<Token>& inserted);
    platform::Message described(const LoginCard& card) const;

    Tokens& _tokens;
    const LoginPolicy& _policy;
    LoginSession _session;
    const Request _request;
    Done _done;
};

}  // namespace vlm::service
