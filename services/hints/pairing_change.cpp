#include "services/hints/pairing_change.h"

#include <algorithm>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/account_spelling.h"
#include "services/hints/hints_log.h"
#include "services/hints/permission.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

constexpr std::size_t kMostCardCharacters = 64;
constexpr std::size_t kShownKeyDigits = 16;

const char* whyNotAsked(SessionState state) {
    switch (state) {
        case SessionState::Attended:
            break;
        case SessionState::None:
            return "an administrator has to allow this, and the program runs in no session of its "
                   "user in which one could be asked. Run the command with sudo if you are one.";
        case SessionState::Away:
            return "an administrator has to allow this, and is only asked at this machine, not "
                   "from afar. Run the command with sudo if you are one.";
        case SessionState::Inactive:
            return "an administrator has to allow this, and another session is in the foreground. "
                   "Switch to your own and try again.";
        case SessionState::Locked:
            return "an administrator has to allow this, and the screen is locked. Unlock it and "
                   "try again.";
        case SessionState::Unknown:
            return "an administrator has to allow this, and logind does not tell whether the "
                   "screen is locked. See the system log.";
    }
    return "";
}

// The question has the name in quotes, and what follows them is ours to say.
std::string quotable(std::string name) {
    std::ranges::replace(name, '"', '\'');
    return name;
}

// Empty when no inserted card has the key.
std::string cardWith(const Bytes& hash, const std::vector<Token>& tokens) {
    for (const auto& token : tokens)
        if (std::ranges::find(token.identities, hash, &Identity::publicKeyHash) !=
            token.identities.end())
            return quotable(platform::harmlessText(token.name, kMostCardCharacters));
    return {};
}

// The details come in by polkit, after it has looked for a translation of the sentence.
std::string sentence(bool isPairing, bool isCardKnown) {
    const char* key = isCardKnown ? "the card \"$(card)\" (key $(key))" : "a card (key $(key))";
    return platform::text(isPairing
                              ? "Authentication is required to pair {} with the account $(account)"
                              : "Authentication is required to unpair {} from the account "
                                "$(account)",
                          key);
}

}  // namespace

void PairingChange::start() {
    if (auto refusal = isPairing() ? refusalToPair() : refusalToUnpair())
        return end(std::move(refusal));
    if (!needsAdministrator(_caller, _request)) return carryOut();
    _sessionQuestion =
        _parts.sessions.ask(_caller, [this](SessionState state) { judgeSession(state); });
}

std::optional<Refusal> PairingChange::refusalToPair() {
    if (!spelling(_request.account))
        return refused(status::kNoSuchAccount, "there is no such account.");
    _proof = _parts.proofs.hold(_caller.user, _request.hash);
    if (_proof) return std::nullopt;
    return refused(status::kNotProved,
                   "a card has to sign with this key first. Log in with the card, and pair within "
                   "a minute.");
}

std::optional<Refusal> PairingChange::refusalToUnpair() {
    const auto pairings = _parts.pairings.pairingsWith(_request.hash);
    if (!pairings) return pairings.refusal();
    const auto account = spelling(_request.account).value_or(_request.account);
    const bool isThere = std::ranges::any_of(*pairings, [&](const Pairing& pairing) {
        return pairing.account == account || pairing.account == _request.account;
    });
    if (isThere) return std::nullopt;
    return refused(status::kNotPaired, "they are not paired.");
}

void PairingChange::judgeSession(SessionState state) {
    const auto self = shared_from_this();
    _sessionQuestion.reset();
    if (state != SessionState::Attended)
        return end(refused(status::kUnattended, whyNotAsked(state)));
    _parts.tokens.list([weak = weak_from_this()](const std::vector<Token>& tokens) {
        if (const auto change = weak.lock()) change->askAdministrator(tokens);
    });
}

void PairingChange::askAdministrator(const std::vector<Token>& tokens) {
    const auto key = platform::hexadecimal(_request.hash);
    const auto card = cardWith(_request.hash, tokens);
    RightQuestion question{_caller, sentence(isPairing(), !card.empty()), {}};
    question.details["account"] = platform::harmlessText(_request.account, kMostCardCharacters);
    question.details["key"] = key.substr(0, kShownKeyDigits) + "...";
    if (!card.empty()) question.details["card"] = card;
    _rightQuestion = _parts.right.ask(question, describe(_request),
                                      [this](const std::optional<Refusal>& refusal) {
                                          const auto self = shared_from_this();
                                          _rightQuestion.reset();
                                          if (!refusal) return carryOut();
                                          end(refused(refusal->status, refusal->text));
                                      });
}

// A person may have taken minutes, and the account may be another's by now.
void PairingChange::carryOut() {
    if (auto refusal = refusalFor(_caller, _request)) return end(std::move(refusal));
    end(isPairing() ? pair() : unpair());
}

std::optional<Refusal> PairingChange::pair() {
    const auto account = spelling(_request.account);
    if (!account) return refused(status::kNoSuchAccount, "there is no such account.");
    if (auto failure = _parts.pairings.pair(*account, _request.hash, _parts.now())) return failure;
    _proof->useUp();
    kLog.notice("paired {} with {} for user {}", platform::harmlessText(*account),
                platform::hexadecimal(_request.hash), _caller.user);
    return std::nullopt;
}

std::optional<Refusal> PairingChange::unpair() {
    // An account that is gone, or is spelled differently now, can still be unpaired.
    const auto account = spelling(_request.account).value_or(_request.account);
    auto wasThere = _parts.pairings.unpair(account, _request.hash);
    if (wasThere && !*wasThere && account != _request.account)
        wasThere = _parts.pairings.unpair(_request.account, _request.hash);
    if (!wasThere) return wasThere.refusal();
    if (!*wasThere) return refused(status::kNotPaired, "they are not paired.");
    kLog.notice("unpaired {} from {} for user {}", platform::harmlessText(account),
                platform::hexadecimal(_request.hash), _caller.user);
    return std::nullopt;
}

Refusal PairingChange::refused(platform::Status status, std::string_view why) const {
    return service::refused(status, _request, why);
}

void PairingChange::end(std::optional<Refusal> refusal) {
    _proof.reset();
    std::exchange(_done, nullptr)(std::move(refusal));
}

}  // namespace vlm::service
