#include "services/pam/authentication.h"

#include <security/pam_modules.h>

#include <utility>

#include "platform/text.h"
#include "services/pam/way_back_in.h"

namespace vlm::pam {

namespace {

constexpr std::size_t kMostPin = 256;
constexpr const char* kOnlyACard = "Only a smart card lets you in here.";
constexpr const char* kNoService =
    "Only a smart card lets you in here, and the service for smart cards does not answer.";
constexpr const char* kKeyringAsks = "The login keyring will ask for its password.";

const char* nameOf(Found::Kind kind) {
    constexpr const char* kNames[] = {
        "a card",       "no card",     "no card, which is required", "a refused card",
        "a locked PIN", "no decision", "an unclear answer"};
    return kNames[static_cast<int>(kind)];
}

}  // namespace

int Authentication::run() {
    transaction().forget();
    const bool isFromAfar = !transaction().remoteHost().empty();
    const auto user = transaction().user();
    if (user.empty()) return isFromAfar ? askAndLogInFromAfar() : logInNobodyInParticular();
    return isFromAfar ? logInFromAfar(user) : logIn(user);
}

// Who comes over the network has no card in this machine. What is typed there must never reach the
// card that somebody else has in it: a few wrong passwords would lock it.
int Authentication::logInFromAfar(const std::string& account) {
    const auto found = search(account);
    if (found.kind == Found::Kind::Card) return usePassword(account, found.card);
    if (found.kind != Found::Kind::Refused && found.kind != Found::Kind::PinLocked)
        return withoutCard(account, found);
    if (!_parts.requiresCard(account)) return PAM_AUTHINFO_UNAVAIL;
    return refuseForWantOfCard(account, PAM_AUTH_ERR, kOnlyACard);
}

int Authentication::askAndLogInFromAfar() {
    const int asked = transaction().askForUser();
    return asked == PAM_SUCCESS ? logInFromAfar(transaction().user()) : asked;
}

// The card may say who it is. Where it does not, the person is asked, and the rules for that
// account count.
int Authentication::logInNobodyInParticular() {
    const auto found = search("");
    if (found.kind == Found::Kind::Card) return logInWith("", found.card);
    const int asked = transaction().askForUser();
    return asked == PAM_SUCCESS ? logIn(transaction().user()) : asked;
}

int Authentication::logIn(const std::string& account) {
    const auto found = search(account);
    return found.kind == Found::Kind::Card ? logInWith(account, found.card)
                                           : withoutCard(account, found);
}

Found Authentication::search(const std::string& account) {
    auto found = readFound(_parts.exchange(cardSearch(account), _parts.patience));
    transaction().debug(platform::text("the search for a card found {}", nameOf(found.kind)));
    return found;
}

// An account that is not named is the card's, once the card has proved itself.
int Authentication::logInWith(const std::string& account, const FoundCard& card) {
    if (card.hasPinPad) {
        transaction().inform(
            platform::text("Enter the PIN of the card \"{}\" at the reader.", card.name));
        return prove(account, card, nullptr);
    }
    service::Secret pin;
    if (const int asked = askForPin(card, pin); asked != PAM_SUCCESS) return asked;
    if (pin.empty()) return usePassword(account, card);
    if (pin.text().size() > kMostPin) {
        transaction().warn("No card has a PIN as long as that.");
        return PAM_AUTH_ERR;
    }
    return prove(account, card, &pin);
}

int Authentication::askForPin(const FoundCard& card, service::Secret& pin) {
    if (card.isLastTry)
        transaction().warn("Only one try is left. A wrong PIN now locks the card.");
    else if (card.hasFewTriesLeft)
        transaction().inform("Only a few tries are left before the card is locked.");
    auto answer = transaction().askSecretly(platform::text("PIN of the card \"{}\": ", card.name));
    if (answer.result == PAM_SUCCESS && answer.text) pin = std::move(*answer.text);
    return answer.result;
}

int Authentication::prove(const std::string& account, const FoundCard& card,
                          const service::Secret* pin) {
    const auto& named = account.empty() ? card.account : account;
    const auto request = cardLogin(named, card, pin);
    if (!request) return PAM_SYSTEM_ERR;
    const auto answer = readLogin(_parts.exchange(*request, kCardPatience));
    transaction().debug(platform::text("the login with the card ended with {}", answer.result));
    if (answer.result == PAM_SUCCESS) return letIn(account, card, answer);
    if (!answer.text.empty()) transaction().warn(answer.text);
    return answer.result;
}

int Authentication::letIn(const std::string& account, const FoundCard& card,
                          const LoginAnswer& answer) {
    if (account.empty() && transaction().setUser(card.account) != PAM_SUCCESS)
        return PAM_SYSTEM_ERR;
    const auto& named = account.empty() ? card.account : account;
    if (transaction().remember({named, card.tokenIdentifier, card.hash}) != PAM_SUCCESS)
        return PAM_SYSTEM_ERR;
    const bool isGiven =
        answer.unlockKey && transaction().giveToken(*answer.unlockKey) == PAM_SUCCESS;
    if (!isGiven) transaction().inform(answer.text.empty() ? kKeyringAsks : answer.text);
    return PAM_SUCCESS;
}

// The person wants to. A card that named itself says nothing of who that is.
int Authentication::usePassword(const std::string& account, const FoundCard& card) {
    if (!account.empty())
        return card.isRequired ? refuseForWantOfCard(account, PAM_AUTH_ERR, kOnlyACard)
                               : PAM_AUTHINFO_UNAVAIL;
    if (const int asked = transaction().askForUser(); asked != PAM_SUCCESS) return asked;
    const auto user = transaction().user();
    const auto found = search(user);
    return found.kind == Found::Kind::Card ? usePassword(user, found.card)
                                           : withoutCard(user, found);
}

int Authentication::withoutCard(const std::string& account, const Found& found) {
    switch (found.kind) {
        case Found::Kind::Card:
        case Found::Kind::Nonsense:
            return refuseForWantOfCard(account, PAM_SYSTEM_ERR,
                                       "The service for smart cards gave an unclear answer.");
        case Found::Kind::NoCard:
            return PAM_AUTHINFO_UNAVAIL;
        case Found::Kind::CardRequired:
            return refuseForWantOfCard(account, PAM_AUTH_ERR, found.text);
        case Found::Kind::Refused:
            transaction().warn(found.text);
            return PAM_AUTH_ERR;
        case Found::Kind::PinLocked:
            transaction().warn(found.text);
            return PAM_MAXTRIES;
        case Found::Kind::NoDecision:
            if (!_parts.requiresCard(account)) return PAM_AUTHINFO_UNAVAIL;
            return refuseForWantOfCard(account, PAM_AUTH_ERR, kNoService);
    }
    return PAM_SYSTEM_ERR;
}

int Authentication::refuseForWantOfCard(const std::string& account, int result,
                                        const std::string& why) {
    if (isRootAtConsole(account, transaction().terminal(), transaction().remoteHost()))
        return PAM_AUTHINFO_UNAVAIL;
    transaction().warn(why);
    return result;
}

}  // namespace vlm::pam
