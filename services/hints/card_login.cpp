#include "services/hints/card_login.h"

#include <utility>

#include "platform/harmless_text.h"
#include "services/hints/hints_log.h"
#include "services/hints/reply.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

namespace {

constexpr const char* kNoUnlockKey =
    "no key of the login keyring is stored for this card, so its password is asked for.";
constexpr const char* kBrokenUnlockKey =
    "the stored key of the login keyring cannot be opened, so its password is asked for. Pair the "
    "card again to store a new one.";

}  // namespace

void CardLogin::start() {
    _session.check(_request, [this](const std::optional<Refusal>& refusal) {
        if (refusal) return end(*refusal);
        look();
    });
}

void CardLogin::look() {
    _parts.login.tokens.list([weak = weak_from_this()](const std::vector<Token>& inserted) {
        if (const auto self = weak.lock()) self->prove(inserted);
    });
}

Outcome<LoginCard> CardLogin::judge(const std::vector<Token>& inserted) const {
    return _parts.policy.thisCard(_request.account, _request.tokenIdentifier, _request.hash,
                                  inserted);
}

void CardLogin::prove(const std::vector<Token>& inserted) {
    const auto card = judge(inserted);
    if (!card) return end(card.refusal());
    _account = card->account;
    _token = card->token;
    Request proof;
    proof.operation = _request.operation;
    proof.account = _request.account;
    proof.hash = _request.hash;
    proof.tokenIdentifier = _request.tokenIdentifier;
    proof.pin = std::exchange(_request.pin, std::nullopt);
    _login = std::make_shared<Login>(_parts.login, _session.caller(), std::move(proof),
                                     unlockKeyTask(), [this](Outcome<Login::Proved> proved) {
                                         const auto self = shared_from_this();
                                         if (!proved) return end(proved.refusal());
                                         _proved = std::move(*proved);
                                         finish();
                                     });
    // Whoever ends the login lets go of it.
    const auto login = _login;
    login->startAmong(inserted);
}

std::optional<OpenRequest> CardLogin::unlockKeyTask() {
    auto found = _parts.unlockKeys.unlockKey(_account, _request.hash);
    if (!found) {
        kLog.error("{}", found.refusal().text);
        _whyNotUnlocked = kBrokenUnlockKey;
        return std::nullopt;
    }
    if (!*found) {
        _whyNotUnlocked = kNoUnlockKey;
        return std::nullopt;
    }
    _unlockKey = std::move(*found);
    _whyNotUnlocked = kBrokenUnlockKey;
    return cardTask(_unlockKey->wrapped, _unlockKey->wrapKeyHash);
}

// A card may have worked for a minute, and an administrator may have changed his mind meanwhile.
void CardLogin::finish() {
    if (const auto card = judge({_token}); !card) return end(card.refusal());
    kLog.notice("{} logs in with the card {} for user {}", platform::harmlessText(_account),
                platform::harmlessText(_request.tokenIdentifier), _session.caller().user);
    end(letIn());
}

platform::Message CardLogin::letIn() {
    auto reply = numberReply(status::kSuccess);
    if (_proved.opened) {
        const auto key = unwrapUnlockKey(_unlockKey->wrapped, *_proved.opened,
                                         {_account, _request.hash, _unlockKey->wrapKeyHash});
        if (const auto pipe = key ? pipeHolding(*key) : std::nullopt) {
            reply.set("dat1", *pipe);
            return reply;
        }
    }
    if (_unlockKey)
        kLog.error("the unlock key of {} could not be opened ({}): {}",
                   platform::harmlessText(_account), status::kUnlockKeyShut,
                   _proved.opened ? "what is stored is not what was wrapped for this pairing"
                                  : platform::harmlessText(_proved.whyNotOpened, 512));
    reply.set("str1", _whyNotUnlocked);
    return reply;
}

void CardLogin::end(Outcome<platform::Message> outcome) {
    _login.reset();
    std::exchange(_done, nullptr)(std::move(outcome));
}

}  // namespace vlm::service
