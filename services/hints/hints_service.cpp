#include "services/hints/hints_service.h"

#include <set>
#include <string>
#include <utility>

#include "platform/accounts.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/account_spelling.h"
#include "services/hints/card_login.h"
#include "services/hints/hints_log.h"
#include "services/hints/login_search.h"
#include "services/hints/permission.h"
#include "services/hints/reply.h"
#include "services/hints/request.h"
#include "services/hints/status.h"
#include "services/hints/unlock_key_changes.h"

namespace vlm::service {

namespace {

using platform::Message;
using platform::PropertyList;

std::set<Bytes> hashesOn(const std::vector<Token>& tokens) {
    std::set<Bytes> hashes;
    for (const auto& token : tokens)
        for (const auto& identity : token.identities) hashes.insert(identity.publicKeyHash);
    return hashes;
}

// The hashes under "0", "1" and so on; with `inserted`, only those in it.
Outcome<Message> pairingsReply(const std::vector<Pairing>& pairings,
                               const std::set<Bytes>* inserted) {
    PropertyList::Dictionary hashes;
    for (const auto& pairing : pairings)
        if (!inserted || inserted->contains(pairing.hash))
            hashes.append(std::to_string(hashes.size()), pairing.hash);
    return listReply(std::move(hashes));
}

// The whole sentence of a refusal whose text says why.
Refusal explained(const std::string& asked, const Refusal& refusal) {
    return {refusal.status, platform::text("{}: {}", asked, refusal.text)};
}

Outcome<Message> statusReply(const std::optional<Refusal>& refusal) {
    if (refusal) return *refusal;
    return numberReply(status::kSuccess);
}

}  // namespace

void HintsService::handle(const Caller& caller, const IncomingRequest& incoming, Reply reply) {
    const Answer answer = [user = caller.user, reply = std::move(reply)](Outcome<Message> outcome) {
        if (outcome) return reply(std::move(*outcome));
        kLog.notice("refused for user {}: {} ({})", user, outcome.refusal().text,
                    outcome.refusal().status);
        reply(refusalReply(outcome.refusal()));
    };
    auto request = readRequest(incoming);
    if (!request) return answer(request.refusal());
    if (const auto refusal = refusalFor(caller, *request)) return answer(*refusal);
    serve(caller, std::move(*request), answer);
}

void HintsService::serve(const Caller& caller, Request request, const Answer& answer) {
    switch (request.operation) {
        case Operation::Login:
            return login(caller, std::move(request), answer);
        case Operation::TokenInfo:
            return describeTokens(caller, request, answer);
        case Operation::Pair:
        case Operation::Unpair:
            return changePairing(caller, std::move(request), answer);
        case Operation::Pairings:
            return listPairings(request, answer);
        case Operation::IsPaired:
            return answer(isPaired(request));
        case Operation::FindLoginCard:
            return findLoginCard(caller, std::move(request), answer);
        case Operation::CardLogin:
            return logInWithCard(caller, std::move(request), answer);
        case Operation::SessionLogin:
            return answer(noteSessionLogin(request));
        case Operation::UnlockKeybag:
            return unlockKeyring(caller, request, answer);
        case Operation::NameKeyring:
            return nameKeyring(caller, request, answer);
        case Operation::StoreUnlockKey:
            return storeUnlockKey(caller, std::move(request), answer);
        case Operation::EraseUnlockKey:
        case Operation::PasswordChanged:
            return answer(changeUnlockKeys(caller, request));
        case Operation::TokenEndpoints:
            return answer(refused(status::kNotServed, request, "this service does not do that."));
    }
}

void HintsService::login(const Caller& caller, Request request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto done = [this, number = *number, user = caller.user, hash = request.hash,
                       answer](const Outcome<Login::Proved>& proved) {
        if (!proved) return end(number, proved.refusal(), answer);
        _parts.changes.proofs.remember(user, hash);
        end(number, numberReply(status::kSuccess), answer);
    };
    const auto login =
        std::make_shared<Login>(_parts.login, caller, std::move(request), std::nullopt, done);
    _running[*number].work = login;
    login->start();
}

void HintsService::findLoginCard(const Caller& caller, Request request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto search = std::make_shared<LoginSearch>(
        _parts.login.tokens, _parts.changes.sessions, _loginPolicy, caller, std::move(request),
        [this, number = *number, answer](Outcome<Message> outcome) {
            end(number, std::move(outcome), answer);
        });
    _running[*number].work = search;
    search->start();
}

void HintsService::logInWithCard(const Caller& caller, Request request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const CardLoginParts parts{_parts.login, _parts.changes.sessions, _loginPolicy,
                               _parts.unlockKeys.keys};
    const auto login =
        std::make_shared<CardLogin>(parts, caller, std::move(request),
                                    [this, number = *number, answer](Outcome<Message> outcome) {
                                        end(number, std::move(outcome), answer);
                                    });
    _running[*number].work = login;
    login->start();
}

void HintsService::changePairing(const Caller& caller, Request request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto done = [this, number = *number, answer](const std::optional<Refusal>& refusal) {
        end(number, statusReply(refusal), answer);
    };
    const auto change =
        std::make_shared<PairingChange>(_parts.changes, caller, std::move(request), done);
    _running[*number].work = change;
    change->start();
}

void HintsService::storeUnlockKey(const Caller& caller, Request request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto done = [this, number = *number, answer](const std::optional<Refusal>& refusal) {
        end(number, statusReply(refusal), answer);
    };
    const auto storing =
        std::make_shared<UnlockKeyStoring>(_parts.unlockKeys, caller, std::move(request), done);
    _running[*number].work = storing;
    storing->start();
}

void HintsService::nameKeyring(const Caller& caller, const Request& request, const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto done = [this, number = *number, answer,
                       asked = describe(request)](const Outcome<std::string>& name) {
        if (!name) return end(number, explained(asked, name.refusal()), answer);
        auto reply = numberReply(status::kSuccess);
        reply.set("str1", *name);
        end(number, std::move(reply), answer);
    };
    _running[*number].work = std::shared_ptr(_parts.unlockKeys.keyrings.name(request.user, done));
}

void HintsService::unlockKeyring(const Caller& caller, const Request& request,
                                 const Answer& answer) {
    const auto number = begin(caller);
    if (!number) return;
    const auto done = [this, number = *number, answer,
                       asked = describe(request)](const std::optional<Refusal>& refusal) {
        if (refusal) return end(number, explained(asked, *refusal), answer);
        end(number, numberReply(status::kSuccess), answer);
    };
    _running[*number].work =
        std::shared_ptr(_parts.unlockKeys.keyrings.unlock(request.user, *request.password, done));
}

Outcome<Message> HintsService::changeUnlockKeys(const Caller& caller, const Request& request) {
    auto& keys = _parts.unlockKeys.keys;
    if (request.operation == Operation::EraseUnlockKey)
        return statusReply(eraseUnlockKey(keys, caller, request));
    const auto count = wrapAnew(keys, caller, request);
    if (!count) return count.refusal();
    auto reply = numberReply(status::kSuccess);
    reply.set("num1", static_cast<std::int64_t>(*count));
    return reply;
}

std::optional<std::uint64_t> HintsService::begin(const Caller& caller) {
    const auto number = ++_last;
    auto watch =
        _parts.callers.watch(caller.connection, [this, number] { _running.erase(number); });
    if (!watch) return std::nullopt;
    _running[number].watch = std::move(watch);
    return number;
}

// Last the answer: it may be the last thing that this service does.
void HintsService::end(std::uint64_t number, Outcome<Message> outcome, const Answer& answer) {
    const auto ended = _running.extract(number);
    answer(std::move(outcome));
}

void HintsService::describeTokens(const Caller& caller, const Request& request,
                                  const Answer& answer) {
    _parts.login.tokens.list(
        [this, alive = std::weak_ptr(_alive), caller, answer, only = request.tokenIdentifier,
         asksWhen = request.asksWhenToLookAgain](const std::vector<Token>& tokens) {
            if (alive.expired()) return;
            auto reply = describeTokens(caller, only, tokens);
            if (reply && asksWhen)
                reply->set("num1", static_cast<std::int64_t>(_parts.login.tokens.lookAgain()));
            answer(std::move(reply));
        });
}

Outcome<Message> HintsService::describeTokens(const Caller& caller, const std::string& onlyToken,
                                              const std::vector<Token>& tokens) {
    PairingsByHash pairings;
    for (const auto& hash : hashesOn(tokens)) {
        auto found = _parts.changes.pairings.pairingsWith(hash);
        if (!found) return found.refusal();
        if (!found->empty()) pairings[hash] = std::move(*found);
    }
    TokenInfoRequest request{.onlyToken = onlyToken, .now = _parts.changes.now()};
    if (!caller.isRoot())
        request.onlyAccount = platform::current().accounts().userName(caller.user).value_or("");
    return tokenInfoReply(tokenInfo(tokens, pairings, request));
}

void HintsService::listPairings(const Request& request, const Answer& answer) {
    auto pairings =
        _parts.changes.pairings.pairingsOf(spelling(request.account).value_or(request.account));
    if (!pairings) return answer(pairings.refusal());
    if (!request.insertedOnly) return answer(pairingsReply(*pairings, nullptr));
    _parts.login.tokens.list(
        [answer, pairings = std::move(*pairings)](const std::vector<Token>& tokens) {
            const auto inserted = hashesOn(tokens);
            answer(pairingsReply(pairings, &inserted));
        });
}

Outcome<Message> HintsService::isPaired(const Request& request) {
    const auto answer =
        _parts.changes.pairings.isPaired(spelling(request.account).value_or(request.account));
    if (!answer) return answer.refusal();
    return numberReply(*answer ? 1 : 0);
}

Outcome<Message> HintsService::noteSessionLogin(const Request& request) {
    if (const auto refusal = _parts.sessionLogin.note(request)) return *refusal;
    return numberReply(status::kSuccess);
}

}  // namespace vlm::service
