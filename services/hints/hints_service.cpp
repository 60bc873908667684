#include "services/hints/hints_service.h"

#include <set>
#include <string>
#include <utility>

#include "platform/accounts.h"
#include "platform/harmless_text.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/permission.h"
#include "services/hints/reply.h"
#include "services/hints/request.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

using platform::Message;
using platform::PropertyList;

// The name as the account database spells it, which may differ from how a person does; none when
// there is no such account.
std::optional<std::string> spelling(const std::string& account) {
    auto& accounts = platform::current().accounts();
    const auto id = accounts.userId(account);
    if (!id) return std::nullopt;
    return accounts.userName(*id).value_or(account);
}

Refusal refused(platform::Status status, const Request& request, std::string_view why) {
    return {status, platform::text("{}: {}", describe(request), why)};
}

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
            return answer(pair(caller, request));
        case Operation::Unpair:
            return answer(unpair(caller, request));
        case Operation::Pairings:
            return listPairings(request, answer);
        case Operation::IsPaired:
            return answer(isPaired(request));
        case Operation::UnlockKeybag:
        case Operation::TokenEndpoints:
            return answer(refused(status::kNotServed, request, "this service does not do that."));
    }
}

void HintsService::login(const Caller& caller, Request request, const Answer& answer) {
    const auto number = ++_lastLogin;
    auto watch = _parts.callers.watch(caller.connection, [this, number] { _logins.erase(number); });
    if (!watch) return;
    const auto hash = request.hash;
    const auto done = [this, number, user = caller.user, hash,
                       answer](const std::optional<Refusal>& refusal) {
        if (!refusal) _parts.proofs.remember(user, hash);
        // Last the answer: it may be the last thing that this service does.
        const auto ended = _logins.extract(number);
        if (refusal) return answer(*refusal);
        answer(numberReply(status::kSuccess));
    };
    const auto login = std::make_shared<Login>(_parts.login, caller, std::move(request), done);
    _logins[number] = {login, std::move(watch)};
    login->start();
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
        auto found = _parts.pairings.pairingsWith(hash);
        if (!found) return found.refusal();
        if (!found->empty()) pairings[hash] = std::move(*found);
    }
    TokenInfoRequest request{.onlyToken = onlyToken, .now = _parts.now()};
    if (!caller.isRoot())
        request.onlyAccount = platform::current().accounts().userName(caller.user).value_or("");
    return tokenInfoReply(tokenInfo(tokens, pairings, request));
}

Outcome<Message> HintsService::pair(const Caller& caller, const Request& request) {
    const auto account = spelling(request.account);
    if (!account) return refused(status::kNoSuchAccount, request, "there is no such account.");
    if (!_parts.proofs.hold(caller.user, request.hash))
        return refused(status::kNotProved, request,
                       "a card has to sign with this key first. Log in with the card, and pair "
                       "within a minute.");
    if (const auto failure = _parts.pairings.pair(*account, request.hash, _parts.now()))
        return *failure;
    _parts.proofs.useUp(caller.user, request.hash);
    kLog.notice("paired {} with {} for user {}", platform::harmlessText(*account),
                platform::hexadecimal(request.hash), caller.user);
    return numberReply(status::kSuccess);
}

Outcome<Message> HintsService::unpair(const Caller& caller, const Request& request) {
    // An account that is gone, or is spelled differently now, can still be unpaired.
    const auto account = spelling(request.account).value_or(request.account);
    auto wasThere = _parts.pairings.unpair(account, request.hash);
    if (wasThere && !*wasThere && account != request.account)
        wasThere = _parts.pairings.unpair(request.account, request.hash);
    if (!wasThere) return wasThere.refusal();
    if (!*wasThere) return refused(status::kNotPaired, request, "they are not paired.");
    kLog.notice("unpaired {} from {} for user {}", platform::harmlessText(account),
                platform::hexadecimal(request.hash), caller.user);
    return numberReply(status::kSuccess);
}

void HintsService::listPairings(const Request& request, const Answer& answer) {
    auto pairings = _parts.pairings.pairingsOf(spelling(request.account).value_or(request.account));
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
        _parts.pairings.isPaired(spelling(request.account).value_or(request.account));
    if (!answer) return answer.refusal();
    return numberReply(*answer ? 1 : 0);
}

}  // namespace vlm::service
