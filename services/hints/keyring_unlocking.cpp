#include "services/hints/keyring_unlocking.h"

#include <utility>

#include "services/hints/status.h"

namespace vlm::service {

KeyringUnlocking::KeyringUnlocking(LoginKeyring& keyring, Secret password, Done done)
    : _keyring(keyring),
      _password(std::move(password)),
      _done(std::move(done)),
      _work(keyring.find([this](const std::optional<FoundKeyring>& found) { take(found); })) {}

void KeyringUnlocking::take(const std::optional<FoundKeyring>& found) {
    if (!found) return end(Refusal{status::kNoKeyring, "the user has no login keyring."});
    if (!found->checksPasswords)
        return end(Refusal{status::kNoKeyring,
                           "the user's login keyring takes no password from programs."});
    _work = _keyring.tryPassword(_password, [this](KeyringVerdict verdict) { judge(verdict); });
}

void KeyringUnlocking::judge(KeyringVerdict verdict) {
    switch (verdict) {
        case KeyringVerdict::Opened:
            return end(std::nullopt);
        case KeyringVerdict::Refused:
            return end(Refusal{status::kKeyringRefused, "the login keyring refused the password."});
        case KeyringVerdict::Failed:
            return end(Refusal{status::kNoKeyring, "the login keyring does not answer."});
    }
}

// The answer may well destroy this object.
void KeyringUnlocking::end(std::optional<Refusal> refusal) {
    std::exchange(_done, nullptr)(std::move(refusal));
}

}  // namespace vlm::service
