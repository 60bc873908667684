// Login: one proof that an inserted card holds a key, from the request to the answer.
//
// The card is looked up, the PIN is taken from the request or asked for, the card signs a fresh
// challenge, and the signature is verified with the public key whose hash was asked for. A PIN is
// given to the card once, whatever becomes of it. Who logs in an account has asked for the PIN
// already, so nobody is asked for that.
//
// Ownership: by a shared pointer; what comes in for a login that was dropped has no effect, and
//            dropping one withdraws its PIN prompt.
// Threads:   the event loop's. Blocking: never.
// Errors:    the answer is a refusal.
// In tests:  tests/unit/services/login_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/caller.h"
#include "services/hints/outcome.h"
#include "services/hints/pin_prompt.h"
#include "services/hints/request.h"
#include "services/hints/tokens.h"

namespace vlm::service {

// What a login works with; all of it outlives the login.
struct LoginParts {
    // Whether the signature over the challenge was made with the key whose public half is given;
    // false also when the hash is not that key's.
    using Verify = std::function<bool(const Bytes& publicKeyInfo, const Bytes& publicKeyHash,
                                      const Bytes& challenge, const Bytes& signature)>;
    // That many bytes that nobody can foretell; none when there are none to be had.
    using RandomBytes = std::function<std::optional<Bytes>(std::size_t)>;

    Tokens& tokens;
    PinPrompt& prompt;
    Verify verify;
    RandomBytes randomBytes;
};

class Login : public std::enable_shared_from_this<Login> {
public:
    // What the card opened besides; none when nothing was asked, or why not.
    struct Proved {
        std::shared_ptr<const Secret> opened;
        std::string whyNotOpened;
    };
    using Done = std::function<void(Outcome<Proved>)>;

    // The request is one for a login, or for the login of an account. `done` is called once, never
    // before start() has returned.
    Login(const LoginParts& parts, Caller caller, Request request, std::optional<OpenRequest> open,
          Done done);

    void start();

    // Likewise, among cards that were listed just now; here `done` may be called at once.
    void startAmong(const std::vector<Token>& inserted) { choose(inserted); }

private:
    void choose(const std::vector<Token>& tokens);
    void askForPin();
    void takePin(PinAnswer answer);
    void prove(Secret pin);
    void judge(const Proof& proof);
    std::string attempt() const;
    void refuse(platform::Status status, const std::string& why);

    const LoginParts& _parts;
    const Caller _caller;
    Request _request;
    const std::optional<OpenRequest> _open;
    Done _done;

    Token _token;
    Identity _identity;
    Bytes _challenge;
    std::unique_ptr<PinPrompt::Question> _question;
};

}  // namespace vlm::service
