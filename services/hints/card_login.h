// CardLogin: the login of one account with one card, from the request to the answer.
//
// Whether this card may log in this account is judged anew, whatever the search before has said.
// Then the card proves that it is there with its key, and opens the unlock key where there is one.
// A login is good without its unlock key; the answer says why there is none.
//
// Ownership: by a shared pointer; what comes in for a login that was dropped has no effect.
// Threads:   the event loop's. Blocking: as the policy.
// Errors:    the answer is a refusal. The PIN is given to the card once, whatever becomes of it.
// In tests:  tests/unit/services/card_login_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/message.h"
#include "services/hints/caller.h"
#include "services/hints/login.h"
#include "services/hints/login_policy.h"
#include "services/hints/login_session.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"
#include "services/hints/unlock_key_store.h"

namespace vlm::service {

// What the logins of accounts work with; all of it outlives them.
struct CardLoginParts {
    const LoginParts& login;
    CallerSessions& sessions;
    const LoginPolicy& policy;
    UnlockKeyStore& unlockKeys;
};

class CardLogin : public std::enable_shared_from_this<CardLogin> {
public:
    using Done = std::function<void(Outcome<platform::Message>)>;

    // The request is one for the login of an account, by a caller who may ask. `done` is called
    // once, never before start() has returned.
    CardLogin(CardLoginParts parts, Caller caller, Request request, Done done)
        : _parts(parts),
          _session(parts.sessions, std::move(caller)),
          _request(std::move(request)),
          _done(std::move(done)) {}

    void start();

private:
    void look();
    Outcome<LoginCard> judge(const std::vector<Token>& inserted) const;
    void prove(const std::vector<Token>& inserted);
    void finish();
    std::optional<OpenRequest> unlockKeyTask();
    platform::Message letIn();
    void end(Outcome<platform::Message> outcome);

    const CardLoginParts _parts;
    LoginSession _session;
    Request _request;
    Done _done;

    std::string _account;
    Token _token;
    std::optional<UnlockKey> _unlockKey;
    std::string _whyNotUnlocked;
    std::shared_ptr<Login> _login;
    Login::Proved _proved;
};

}  // namespace vlm::service
