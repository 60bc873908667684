#include "services/hints/login.h"

#include <algorithm>
#include <utility>

#include "platform/accounts.h"
#include "platform/harmless_text.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

constexpr std::size_t kChallengeSize = 32;

std::string triesLeft(PinState state) {
    switch (state) {
        case PinState::Ready:
            return {};
        case PinState::FewTriesLeft:
            return "; only a few tries are left";
        case PinState::LastTry:
            return "; only one try is left";
        case PinState::Locked:
            return "; no try is left, and the PIN is locked";
    }
    return {};
}

}  // namespace

Login::Login(const LoginParts& parts, Caller caller, Request request,
             std::optional<OpenRequest> open, Done done)
    : _parts(parts),
      _caller(std::move(caller)),
      _request(std::move(request)),
      _open(std::move(open)),
      _done(std::move(done)) {}

void Login::start() {
    _parts.tokens.list([weak = weak_from_this()](const std::vector<Token>& tokens) {
        if (const auto self = weak.lock()) self->choose(tokens);
    });
}

void Login::choose(const std::vector<Token>& tokens) {
    const auto token = std::ranges::find(tokens, _request.tokenIdentifier, &Token::identifier);
    if (token == tokens.end())
        return refuse(status::kNoSuchToken, "this card is not inserted. Insert it and try again.");
    _token = *token;
    const auto identity =
        std::ranges::find(_token.identities, _request.hash, &Identity::publicKeyHash);
    if (identity == _token.identities.end())
        return refuse(status::kNoSuchKey, "the card holds no identity with this public-key hash.");
    _identity = *identity;
    if (!_identity.canSign)
        return refuse(status::kNoSuchKey, "the card's key with this hash is not for signing.");
    if (_token.needsLogin && _token.pinState == PinState::Locked)
        return refuse(status::kPinLocked,
                      "the card's PIN is locked. Unlock it with the PUK, or ask who issued it.");

    if (!_token.needsLogin) return prove({});
    if (_request.pin) return prove(std::move(*_request.pin));
    if (_token.hasPinPad) return prove({});
    if (_request.operation == Operation::CardLogin)
        return refuse(status::kNoPin, "the card wants a PIN.");
    askForPin();
}

void Login::askForPin() {
    PinQuestion question{_token.name, _identity.name, _token.pinState, {}, _caller};
    // The proof serves a pairing, which is root's to choose; others pair themselves only.
    if (!_caller.isRoot())
        question.account = platform::current().accounts().userName(_caller.user).value_or("");
    _question = _parts.prompt.ask(question, [weak = weak_from_this()](PinAnswer answer) {
        if (const auto self = weak.lock()) self->takePin(std::move(answer));
    });
}

void Login::takePin(PinAnswer answer) {
    _question.reset();
    switch (answer.outcome) {
        case PinAnswer::Outcome::Given:
            return prove(std::move(answer.pin));
        case PinAnswer::Outcome::Cancelled:
            return refuse(status::kCancelled, "the PIN prompt was cancelled.");
        case PinAnswer::Outcome::TimedOut:
            return refuse(status::kCancelled, "no PIN was entered in time.");
        case PinAnswer::Outcome::Unavailable:
            return refuse(status::kNoPin,
                          platform::text("nobody could be asked for the PIN, because {}.",
                                         platform::harmlessText(answer.reason, 512)));
    }
}

void Login::prove(Secret pin) {
    auto challenge = _parts.randomBytes(kChallengeSize);
    if (!challenge)
        return refuse(status::kCardFailed,
                      "the system has no random numbers to challenge it with.");
    _challenge = std::move(*challenge);
    _parts.tokens.prove(
        {_token.identifier, _identity.publicKeyHash, _challenge, std::move(pin), _open},
        [weak = weak_from_this()](const Proof& proof) {
            if (const auto self = weak.lock()) self->judge(proof);
        });
}

void Login::judge(const Proof& proof) {
    switch (proof.outcome) {
        case Proof::Outcome::Signed:
            break;
        case Proof::Outcome::NoSuchToken:
            return refuse(status::kNoSuchToken,
                          "the card was pulled out. Insert it and try again.");
        case Proof::Outcome::NoSuchKey:
            return refuse(status::kNoSuchKey, "the card holds no private key with this hash.");
        case Proof::Outcome::PinIncorrect:
            return refuse(status::kPinIncorrect, platform::text("the card refused the PIN{}.",
                                                                triesLeft(proof.pinStateAfter)));
        case Proof::Outcome::PinLocked:
            return refuse(
                status::kPinLocked,
                "the card's PIN is locked. Unlock it with the PUK, or ask who issued it.");
        case Proof::Outcome::Cancelled:
            return refuse(status::kCancelled, "it was cancelled at the card reader.");
        case Proof::Outcome::CardFailed:
            return refuse(
                status::kCardFailed,
                platform::text("the card failed: {}.", platform::harmlessText(proof.reason, 512)));
    }
    if (!_parts.verify(_identity.publicKeyInfo, _identity.publicKeyHash, _challenge,
                       proof.signature))
        return refuse(status::kNotProved,
                      "the card's signature is not by this key. Do not trust this card.");
    std::exchange(_done, nullptr)(Proved{proof.opened, proof.whyNotOpened});
}

// A person knows the names, once they are known here.
std::string Login::attempt() const {
    if (_identity.publicKeyHash.empty()) return describe(_request);
    return platform::text("Logging in with \"{}\" of the card \"{}\"", _identity.name, _token.name);
}

void Login::refuse(platform::Status status, const std::string& why) {
    std::exchange(_done, nullptr)(Refusal{status, platform::text("{}: {}", attempt(), why)});
}

}  // namespace vlm::service
