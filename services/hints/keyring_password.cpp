#include "services/hints/keyring_password.h"

#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/status.h"

namespace vlm::service {

KeyringPassword::KeyringPassword(PasswordPrompt& prompt, LoginKeyring& keyring,
                                 KeyringQuestion question, Done done)
    : _prompt(prompt),
      _keyring(keyring),
      _question(std::move(question)),
      _done(std::move(done)),
      _work(keyring.find([this](std::optional<FoundKeyring> found) { take(std::move(found)); })) {}

void KeyringPassword::take(std::optional<FoundKeyring> found) {
    _work.reset();
    if (!found || found->path != _question.keyring)
        return end(Refusal{status::kNoKeyring, "the user has no such login keyring."});
    _checksPasswords = found->checksPasswords;
    if (!_checksPasswords)
        kLog.notice("the login keyring checks no password for programs; it is asked for twice");
    ask();
}

void KeyringPassword::ask() {
    PasswordQuestion question{_question.card, _question.account};
    question.wasRefused = _wrongTries > 0;
    question.isTypedTwice = !_checksPasswords;
    _asked = _prompt.ask(question, [this](PinAnswer answer) { take(std::move(answer)); });
}

void KeyringPassword::take(PinAnswer answer) {
    _asked.reset();
    switch (answer.outcome) {
        case PinAnswer::Outcome::Given:
            break;
        case PinAnswer::Outcome::Cancelled:
            return end(Refusal{status::kCancelled,
                               "the question for the login keyring's password was cancelled."});
        case PinAnswer::Outcome::TimedOut:
            return end(Refusal{status::kCancelled,
                               "the login keyring's password was not entered in time."});
        case PinAnswer::Outcome::Unavailable:
            return end(Refusal{status::kNoKeyring,
                               platform::text("nobody could be asked for the login keyring's "
                                              "password, because {}.",
                                              platform::harmlessText(answer.reason, 256))});
    }
    if (!_checksPasswords) return end(std::move(answer.pin));
    _password = std::move(answer.pin);
    _work = _keyring.tryPassword(_password, [this](KeyringVerdict verdict) { judge(verdict); });
}

void KeyringPassword::judge(KeyringVerdict verdict) {
    _work.reset();
    switch (verdict) {
        case KeyringVerdict::Opened:
            return end(std::move(_password));
        case KeyringVerdict::Failed:
            return end(Refusal{status::kNoKeyring, "the login keyring does not answer."});
        case KeyringVerdict::Refused:
            break;
    }
    if (++_wrongTries < kTries) return ask();
    end(Refusal{status::kKeyringRefused,
                platform::text("the login keyring refused the password, {} times.", kTries)});
}

// The answer may well destroy this object.
void KeyringPassword::end(Outcome<Secret> outcome) {
    std::exchange(_done, nullptr)(std::move(outcome));
}

}  // namespace vlm::service
