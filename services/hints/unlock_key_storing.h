// UnlockKeyStoring: one unlock key, from the request to the database.
//
// What can be refused without asking anybody is refused first: the user, a pairing that is not
// there, a card that is not in or whose wrap key is another one. Only then the person is asked for
// the keyring's password, so nobody is asked in vain. The password is wrapped for the card at once
// and kept nowhere else.
//
// Ownership: by a shared pointer; dropping it withdraws the question, and nothing is stored.
// Threads:   the event loop's. Blocking: for the database only.
// Errors:    the answer is a refusal.
// In tests:  tests/unit/services/unlock_key_storing_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "services/hints/caller.h"
#include "services/hints/outcome.h"
#include "services/hints/pairing_store.h"
#include "services/hints/request.h"
#include "services/hints/tokens.h"
#include "services/hints/unlock_key_store.h"
#include "services/hints/user_keyrings.h"

namespace vlm::service {

// What it works with; all of it outlives the storing.
struct UnlockKeyParts {
    Tokens& tokens;
    PairingStore& pairings;
    UnlockKeyStore& keys;
    UserKeyrings& keyrings;
};

class UnlockKeyStoring : public std::enable_shared_from_this<UnlockKeyStoring> {
public:
    using Done = std::function<void(std::optional<Refusal>)>;

    // The request is one for storing, by a caller who may have that done. `done` is called once,
    // perhaps before start() has returned.
    UnlockKeyStoring(const UnlockKeyParts& parts, Caller caller, Request request, Done done)
        : _parts(parts),
          _caller(std::move(caller)),
          _request(std::move(request)),
          _done(std::move(done)) {}

    void start();

private:
    std::optional<Refusal> whyNotPaired();
    void choose(const std::vector<Token>& tokens);
    std::optional<Refusal> whyNotFit(const Token& token);
    void ask(const std::string& card);
    void store(const Secret& password);
    Refusal refused(platform::Status status, std::string_view why) const;
    void end(std::optional<Refusal> refusal);

    const UnlockKeyParts& _parts;
    const Caller _caller;
    const Request _request;
    Done _done;

    std::string _account;
    Bytes _wrapPublicInfo;
    WrapScheme _wrapScheme = WrapScheme::RsaOaepSha256;
    std::unique_ptr<UserKeyrings::Question> _question;
};

}  // namespace vlm::service
