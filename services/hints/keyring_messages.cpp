#include "services/hints/keyring_messages.h"

#include <utility>

#include "platform/harmless_text.h"
#include "platform/token_framework.h"
#include "services/hints/reply.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

namespace {

constexpr const char* kPassword = "password";
constexpr std::size_t kMostText = 4096;
constexpr std::size_t kMostShown = 512;

std::string boundedText(const platform::Message& message, const char* key) {
    const auto* text = message.text(key);
    return text && text->size() <= kMostText ? *text : std::string();
}

std::optional<Secret> passwordIn(const platform::Message& message) {
    const auto pipe = message.endpoint(kPassword);
    auto password = pipe ? secretIn(*pipe) : std::nullopt;
    if (password && password->text().size() > kMostUnlockKeyBytes) return std::nullopt;
    return password;
}

Refusal notUnderstood() {
    return {status::kNoKeyring, "the answer of the user's own hints service cannot be understood."};
}

// What a user's own instance may refuse with. Any other number would say something of the daemon's.
bool isRefusalOfKeyrings(platform::Status status) {
    return status == status::kNoKeyring || status == status::kKeyringRefused ||
           status == status::kCancelled;
}

}  // namespace

platform::Message writeKeyringQuestion(const KeyringQuestion& question) {
    platform::Message message;
    message.set("card", question.card);
    message.set("account", question.account);
    message.set("str2", question.keyring);
    return message;
}

std::optional<KeyringQuestion> readKeyringQuestion(const platform::Message& message) {
    KeyringQuestion question{boundedText(message, "card"), boundedText(message, "account"),
                             boundedText(message, "str2")};
    if (question.card.empty() || question.account.empty() || question.keyring.empty())
        return std::nullopt;
    return question;
}

std::optional<platform::Message> writeUnlocking(const Secret& password) {
    auto pipe = pipeHolding(password);
    if (!pipe) return std::nullopt;
    platform::Message message;
    message.set(kPassword, std::move(*pipe));
    return message;
}

std::optional<Secret> readUnlocking(const platform::Message& message) {
    return passwordIn(message);
}

platform::Message writeKeyringName(const std::string& name) {
    auto message = numberReply(status::kSuccess);
    message.set("str1", name);
    return message;
}

Outcome<std::string> readKeyringName(const platform::Message& message) {
    if (auto refusal = readRefusal(message)) return std::move(*refusal);
    auto name = boundedText(message, "str1");
    if (name.empty()) return notUnderstood();
    return name;
}

platform::Message writeKeyringPassword(const Secret& password) {
    auto pipe = pipeHolding(password);
    if (!pipe) return refusalReply({status::kNoKeyring, "the system has no room for a pipe."});
    auto message = numberReply(status::kSuccess);
    message.set(kPassword, std::move(*pipe));
    return message;
}

Outcome<Secret> readKeyringPassword(const platform::Message& message) {
    if (auto refusal = readRefusal(message)) return std::move(*refusal);
    auto password = passwordIn(message);
    if (!password) return notUnderstood();
    return std::move(*password);
}

std::optional<Refusal> readRefusal(const platform::Message& message) {
    const auto result = message.integer("res");
    std::optional<platform::Error> error;
    const bool isError = !platform::decodeReplyError(message, &error);
    if (result == status::kSuccess && !isError) return std::nullopt;
    if (!result || !error || !isRefusalOfKeyrings(static_cast<platform::Status>(*result)))
        return notUnderstood();
    return Refusal{static_cast<platform::Status>(*result),
                   platform::harmlessText(error->description(), kMostShown)};
}

}  // namespace vlm::service
