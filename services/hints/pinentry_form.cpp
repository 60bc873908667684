#include "services/hints/pinentry_form.h"

#include <string_view>

#include "platform/harmless_text.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

using namespace std::chrono_literals;

// The protocol allows lines of 1000 bytes; this many characters of a name fit beside the rest.
constexpr std::size_t kMostNameCharacters = 64;
constexpr std::size_t kMostAccountCharacters = 32;

constexpr std::size_t kMostPin = 256;
constexpr std::size_t kMostPassword = 1024;

std::string shownName(const std::string& name) {
    return platform::harmlessText(name, kMostNameCharacters);
}

std::string shownAccount(const std::string& account) {
    return platform::harmlessText(account, kMostAccountCharacters);
}

std::string_view triesLeft(PinState state) {
    switch (state) {
        case PinState::FewTriesLeft:
            return "\n\nA wrong PIN was entered before, and only a few tries are left.";
        case PinState::LastTry:
            return "\n\nThis is the last try: after another wrong PIN the card is locked.";
        case PinState::Ready:
        case PinState::Locked:
            break;
    }
    return {};
}

std::string pinDescription(const PinQuestion& question) {
    const auto whose = question.account.empty() ? std::string("an account")
                                                : "the account " + shownAccount(question.account);
    return platform::text(
        "Enter the PIN of the card \"{}\". The card then proves that it holds the identity "
        "\"{}\", so that it can be paired with {}.{}",
        shownName(question.card), shownName(question.identity), whose, triesLeft(question.state));
}

std::string lastTryWarning(const PinQuestion& question) {
    return platform::text(
        "The PIN of the card \"{}\" was entered wrongly before, and only one try is left. After "
        "another wrong PIN the card is locked, and whoever issued it has to unlock it.\n\nDo you "
        "know the PIN for certain, and want to enter it?",
        shownName(question.card));
}

}  // namespace

PinentryForm pinForm(const PinQuestion& question) {
    PinentryForm form;
    form.title = "Smart card";
    if (question.state == PinState::LastTry) form.warning = lastTryWarning(question);
    form.description = pinDescription(question);
    form.prompt = "PIN:";
    form.mostBytes = kMostPin;
    form.patience = 120s;
    return form;
}

PinentryForm passwordForm(const PasswordQuestion& question) {
    PinentryForm form;
    form.title = "Login keyring";
    form.description = platform::text(
        "Enter the password of your login keyring, once, so that the card \"{}\" can open it from "
        "now on when {} logs in with it. As a rule it is your login password.{}",
        shownName(question.card), shownAccount(question.account),
        question.isTypedTwice ? "\n\nIt cannot be checked here, so it is asked for twice." : "");
    if (question.wasRefused) form.error = "This password does not open your login keyring.";
    form.prompt = "Password:";
    if (question.isTypedTwice) form.repeatPrompt = "Again:";
    form.mostBytes = kMostPassword;
    form.patience = 600s;
    return form;
}

}  // namespace vlm::service
