// LoginPolicy: which inserted card logs an account in, and what counts where there is none.
//
// A card logs in an account that is there and paired with it. The card can sign and asks for a
// PIN, its certificate is accepted now, and the machine lets people use cards at all. Of several
// such pairings the latest counts. What is told of an account without a card is the same whether it
// is unknown, has no pairing, or has its card at home.
//
// Threads:  one. Blocking: for the pairings, the account database and the settings.
// Errors:   refusals: kNoLoginCard where the password is asked for instead, kCardRequired where the
//           account may log in with a card only, and why the card that is there is not accepted.
// In tests: tests/unit/services/login_policy_test.cpp

#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/outcome.h"
#include "services/hints/pairing_store.h"
#include "services/hints/tokens.h"
#include "settings/smartcard_configuration.h"

namespace vlm::service {

struct LoginCard {
    std::string account;  // as the account database spells it
    Token token;
    Identity identity;
};

class LoginPolicy {
public:
    struct Parts {
        PairingStore& pairings;
        std::function<std::int64_t()> now;  // seconds since 1970-01-01 00:00:00 UTC
        std::filesystem::path configuration = kSmartcardConfiguration;
    };

    explicit LoginPolicy(Parts parts) : _parts(std::move(parts)) {}

    // The card to log in the account with.
    Outcome<LoginCard> cardOf(const std::string& account, const std::vector<Token>& inserted) const;

    // The card to log in the one account with that the inserted cards are paired with.
    Outcome<LoginCard> cardOfAnybody(const std::vector<Token>& inserted) const;

    // This key of this card, if it may log in the account.
    Outcome<LoginCard> thisCard(const std::string& account, const std::string& tokenIdentifier,
                                const Bytes& hash, const std::vector<Token>& inserted) const;

    // Whether the account may log in with a card only; without a name, whether everybody must.
    bool requiresCard(const std::optional<std::string>& account) const;

private:
    // A pairing whose card is inserted and can sign.
    struct Candidate {
        Pairing pairing;
        const Token* token;
        const Identity* identity;
    };

    Outcome<std::vector<Candidate>> candidates(const std::vector<Token>& inserted) const;
    Outcome<LoginCard> choose(const std::vector<Candidate>& candidates,
                              const std::optional<std::string>& account) const;
    std::optional<Refusal> whyNotAccepted(const Candidate& candidate) const;
    Refusal noCard(const std::optional<std::string>& account) const;

    Parts _parts;
};

}  // namespace vlm::service
