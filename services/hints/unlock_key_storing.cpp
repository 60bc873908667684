#include "services/hints/unlock_key_storing.h"

#include <algorithm>
#include <utility>

#include "platform/accounts.h"
#include "platform/harmless_text.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

void UnlockKeyStoring::start() {
    if (auto refusal = whyNotPaired()) return end(std::move(refusal));
    _parts.tokens.list([weak = weak_from_this()](const std::vector<Token>& tokens) {
        if (const auto self = weak.lock()) self->choose(tokens);
    });
}

std::optional<Refusal> UnlockKeyStoring::whyNotPaired() {
    const auto account = platform::current().accounts().userName(_request.user);
    if (!account) return refused(status::kNoSuchAccount, "there is no such user.");
    _account = *account;
    const auto pairings = _parts.pairings.pairingsOf(_account);
    if (!pairings) return pairings.refusal();
    if (std::ranges::find(*pairings, _request.hash, &Pairing::hash) != pairings->end())
        return std::nullopt;
    return refused(status::kNotPaired, "they are not paired.");
}

void UnlockKeyStoring::choose(const std::vector<Token>& tokens) {
    const auto token = std::ranges::find(tokens, _request.tokenIdentifier, &Token::identifier);
    if (token == tokens.end())
        return end(
            refused(status::kNoSuchToken, "this card is not inserted. Insert it and pair again."));
    if (auto refusal = whyNotFit(*token)) return end(std::move(refusal));
    ask(token->name);
}

// The card that logs in is the one that opens the keyring, and the key is the one that the caller
// saw.
std::optional<Refusal> UnlockKeyStoring::whyNotFit(const Token& token) {
    const auto& identities = token.identities;
    if (std::ranges::find(identities, _request.hash, &Identity::publicKeyHash) == identities.end())
        return refused(status::kNoSuchKey, "the card holds no identity with this public-key hash.");
    if (!token.wrapKeyHash)
        return refused(status::kNoWrapKey,
                       "the card has no key that can protect a password: neither an RSA key that "
                       "may decrypt nor an elliptic-curve key that may derive.");
    const auto wrapKey =
        std::ranges::find(identities, _request.wrapKeyHash, &Identity::publicKeyHash);
    if (token.wrapKeyHash != _request.wrapKeyHash || wrapKey == identities.end())
        return refused(status::kNoWrapKey, "the card's key for that is another one. Pair again.");
    _wrapPublicInfo = wrapKey->publicKeyInfo;
    _wrapScheme = token.wrapScheme;
    return std::nullopt;
}

void UnlockKeyStoring::ask(const std::string& card) {
    _question = _parts.keyrings.askPassword(
        _request.user, {card, _account, _request.keyring}, [this](const Outcome<Secret>& answer) {
            const auto self = shared_from_this();
            _question.reset();
            if (!answer) return end(refused(answer.refusal().status, answer.refusal().text));
            store(*answer);
        });
}

// A person may have taken minutes: the account may be another's by now, and the pairing gone, which
// the database tells.
void UnlockKeyStoring::store(const Secret& password) {
    if (platform::current().accounts().userName(_request.user) != _account)
        return end(refused(status::kNoSuchAccount, "the user has another name now."));
    auto wrapped = wrapUnlockKey(password, {_account, _request.hash, _request.wrapKeyHash},
                                 _wrapPublicInfo, _wrapScheme);
    if (!wrapped)
        return end(refused(status::kNoWrapKey,
                           "the card's key is of a kind that cannot protect a password."));
    auto failure = _parts.keys.storeUnlockKey(
        {_account, _request.hash, _request.wrapKeyHash, _wrapPublicInfo, std::move(*wrapped)});
    if (failure) return end(std::move(failure));
    kLog.notice("stored the unlock key of {} for {} for user {}", platform::harmlessText(_account),
                platform::hexadecimal(_request.hash), _caller.user);
    if (_wrapScheme == WrapScheme::RsaPkcs1)
        kLog.notice("it is wrapped with PKCS#1 v1.5, since the card can do no other");
    end(std::nullopt);
}

Refusal UnlockKeyStoring::refused(platform::Status status, std::string_view why) const {
    return service::refused(status, _request, why);
}

void UnlockKeyStoring::end(std::optional<Refusal> refusal) {
    std::exchange(_done, nullptr)(std::move(refusal));
}

}  // namespace vlm::service
