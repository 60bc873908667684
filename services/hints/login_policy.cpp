#include "services/hints/login_policy.h"

#include <algorithm>
#include <set>
#include <utility>

#include "platform/accounts.h"
#include "platform/harmless_text.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/certificate_trust.h"
#include "services/hints/status.h"
#include "settings/smartcard_settings_worker.h"

namespace vlm::service {

namespace {

struct KnownAccount {
    std::string name;
    bool exists = false;
};

// Both questions are put to the account database in any case: how long the answer takes must not
// tell who has an account here.
KnownAccount knownAccount(const std::string& name) {
    auto& accounts = platform::current().accounts();
    const auto id = accounts.userId(name);
    const auto spelled = accounts.userName(id.value_or(platform::kNobody));
    return {id ? spelled.value_or(name) : name, id.has_value()};
}

bool exists(const std::string& account) {
    return platform::current().accounts().userId(account).has_value();
}

bool cardsAreAllowed() { return VLGetSmartcardSettingWorker("allowSmartCard") != 0; }

std::string attempt(const std::optional<std::string>& account) {
    if (!account) return "Logging in with a card";
    return platform::text("Logging in {} with a card", platform::harmlessText(*account));
}

}  // namespace

Outcome<LoginCard> LoginPolicy::cardOf(const std::string& account,
                                       const std::vector<Token>& inserted) const {
    const auto known = knownAccount(account);
    auto found = candidates(inserted);
    if (!found) return found.refusal();
    std::erase_if(*found, [&](const Candidate& candidate) {
        return !known.exists || candidate.pairing.account != known.name;
    });
    return choose(*found, known.name);
}

// A card that is not accepted names nobody: whoever it belongs to is asked for the name.
Outcome<LoginCard> LoginPolicy::cardOfAnybody(const std::vector<Token>& inserted) const {
    auto found = candidates(inserted);
    if (!found) return found.refusal();
    std::erase_if(*found, [&](const Candidate& candidate) {
        return whyNotAccepted(candidate) || !exists(candidate.pairing.account);
    });
    std::set<std::string> accounts;
    for (const auto& candidate : *found) accounts.insert(candidate.pairing.account);
    if (accounts.size() != 1) return noCard(std::nullopt);
    return choose(*found, *accounts.begin());
}

Outcome<LoginCard> LoginPolicy::thisCard(const std::string& account,
                                         const std::string& tokenIdentifier, const Bytes& hash,
                                         const std::vector<Token>& inserted) const {
    const auto token = std::ranges::find(inserted, tokenIdentifier, &Token::identifier);
    if (token == inserted.end())
        return Refusal{status::kNoSuchToken,
                       attempt(account) + ": the card was pulled out. Insert it and try again."};
    auto only = *token;
    std::erase_if(only.identities, [&](const auto& each) { return each.publicKeyHash != hash; });
    return cardOf(account, {std::move(only)});
}

bool LoginPolicy::requiresCard(const std::optional<std::string>& account) const {
    const auto isPaired = [&](const auto&) {
        if (!account) return false;
        const auto paired = _parts.pairings.isPaired(*account);
        return !paired || *paired;
    };
    std::optional<platform::String> name;
    if (account) name = platform::String(*account);
    return settingForUser("enforceSmartCard", name, _parts.configuration, isPaired) != 0;
}

// The latest pairing first. A key that two modules show is on the first of their tokens.
Outcome<std::vector<LoginPolicy::Candidate>> LoginPolicy::candidates(
    const std::vector<Token>& inserted) const {
    std::vector<Candidate> found;
    if (!cardsAreAllowed()) return found;
    for (const auto& token : inserted) {
        // A card that asks for no PIN would let in whoever has found it.
        if (!token.needsLogin) continue;
        for (const auto& identity : token.identities) {
            if (!identity.canSign) continue;
            const auto pairings = _parts.pairings.pairingsWith(identity.publicKeyHash);
            if (!pairings) return pairings.refusal();
            for (const auto& pairing : *pairings) found.push_back({pairing, &token, &identity});
        }
    }
    std::ranges::stable_sort(found, std::greater(),
                             [](const Candidate& each) { return each.pairing.sequence; });
    return found;
}

Outcome<LoginCard> LoginPolicy::choose(const std::vector<Candidate>& candidates,
                                       const std::optional<std::string>& account) const {
    std::optional<Refusal> first;
    for (const auto& candidate : candidates) {
        const auto refusal = whyNotAccepted(candidate);
        if (!refusal)
            return LoginCard{candidate.pairing.account, *candidate.token, *candidate.identity};
        if (!first) first = refusal;
    }
    return first ? *first : noCard(account);
}

std::optional<Refusal> LoginPolicy::whyNotAccepted(const Candidate& candidate) const {
    if (auto refusal = whyNotTrusted(*candidate.identity, _parts.now())) return refusal;
    if (candidate.token->pinState != PinState::Locked) return std::nullopt;
    return Refusal{
        status::kPinLocked,
        platform::text(
            "Logging in with \"{}\" of the card \"{}\": the card's PIN is locked. Unlock "
            "it with the PUK, or ask who issued it.",
            candidate.identity->name, candidate.token->name)};
}

Refusal LoginPolicy::noCard(const std::optional<std::string>& account) const {
    if (requiresCard(account))
        return {status::kCardRequired,
                attempt(account) +
                    ": only a card that is paired with the account lets you in "
                    "here. Insert it and try again."};
    return {status::kNoLoginCard, attempt(account) + ": no such card is inserted."};
}

}  // namespace vlm::service
