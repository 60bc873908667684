// The dictionaries of NameKeyring(), AskKeyringPassword() and UnlockKeyring(): what the daemon asks
// of a user's instance, and what that answers.
//
// NameKeyring: nothing; answered by "str1", the keyring. AskKeyringPassword: "card", "account" and
// "str2", the keyring; answered by "password", a pipe. UnlockKeyring: "password"; nothing. Each
// answer has "res", and a refusal its error entry.
//
// Errors:   a question that is not like this is none; an answer that is not is a refusal.
// In tests: tests/unit/services/keyring_errands_test.cpp

#pragma once

#include <optional>
#include <string>

#include "platform/message.h"
#include "services/hints/outcome.h"
#include "services/hints/secret.h"
#include "services/hints/user_keyrings.h"

namespace vlm::service {

platform::Message writeKeyringQuestion(const KeyringQuestion& question);
std::optional<KeyringQuestion> readKeyringQuestion(const platform::Message& message);

// None where the system has no room for a pipe.
std::optional<platform::Message> writeUnlocking(const Secret& password);
std::optional<Secret> readUnlocking(const platform::Message& message);

platform::Message writeKeyringName(const std::string& name);
Outcome<std::string> readKeyringName(const platform::Message& message);

platform::Message writeKeyringPassword(const Secret& password);
Outcome<Secret> readKeyringPassword(const platform::Message& message);

std::optional<Refusal> readRefusal(const platform::Message& message);

}  // namespace vlm::service
