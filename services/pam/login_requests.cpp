#include "services/pam/login_requests.h"

#include <security/pam_modules.h>

#include <algorithm>
#include <cstdint>
#include <limits>

#include "platform/harmless_text.h"
#include "platform/token_framework.h"
#include "services/hints/login_card_flags.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"

namespace vlm::pam {

namespace {

using platform::Message;
using service::LoginCardFlag;
using service::Operation;
namespace status = service::status;

constexpr std::size_t kHashSize = 32;
constexpr std::size_t kMostNameCharacters = 64;
constexpr std::size_t kMostTextCharacters = 512;

std::string errorText(const Message& reply) {
    std::optional<platform::Error> error;
    if (platform::decodeReplyError(reply, &error) || !error) return "The card is not accepted.";
    return platform::harmlessText(error->description(), kMostTextCharacters);
}

// The prompt has the name in quotes, and what follows them is ours to say.
std::string quotable(const std::string& name) {
    auto shown = platform::harmlessText(name, kMostNameCharacters);
    std::ranges::replace(shown, '"', '\'');
    return shown;
}

std::optional<FoundCard> readCard(const Message& reply) {
    const auto* account = reply.text("str1");
    const auto* token = reply.text("str2");
    const auto* name = reply.text("str3");
    const auto* hash = reply.bytes("dat1");
    const auto flags = reply.integer("num1");
    if (!account || account->empty() || !token || token->empty() || !name || !hash || !flags ||
        hash->size() != kHashSize)
        return std::nullopt;
    const auto has = [&](LoginCardFlag flag) {
        return (*flags & static_cast<std::int64_t>(flag)) != 0;
    };
    return FoundCard{*account,
                     *token,
                     quotable(*name),
                     *hash,
                     has(LoginCardFlag::PinPad),
                     has(LoginCardFlag::FewTriesLeft),
                     has(LoginCardFlag::LastTry),
                     has(LoginCardFlag::CardRequired)};
}

Found::Kind kindOf(std::int64_t status) {
    switch (status) {
        case status::kNoLoginCard:
            return Found::Kind::NoCard;
        case status::kCardRequired:
            return Found::Kind::CardRequired;
        case status::kCertificateRefused:
            return Found::Kind::Refused;
        case status::kPinLocked:
            return Found::Kind::PinLocked;
        default:
            return Found::Kind::NoDecision;
    }
}

}  // namespace

Message requestOf(Operation operation) {
    Message request;
    request.set("op", static_cast<std::uint64_t>(operation));
    return request;
}

Message cardSearch(const std::string& account) {
    auto request = requestOf(Operation::FindLoginCard);
    if (!account.empty()) request.set("str1", account);
    return request;
}

Found readFound(const std::optional<Message>& reply) {
    if (!reply) return {Found::Kind::NoDecision};
    const auto status = reply->integer("res");
    if (!status || *status > 0) return {Found::Kind::Nonsense};
    if (*status != status::kSuccess) return {kindOf(*status), {}, errorText(*reply)};
    auto card = readCard(*reply);
    if (!card) return {Found::Kind::Nonsense};
    return {Found::Kind::Card, std::move(*card)};
}

std::optional<Message> cardLogin(const std::string& account, const FoundCard& card,
                                 const service::Secret* pin) {
    auto request = requestOf(Operation::CardLogin);
    request.set("str1", account);
    request.set("str2", card.tokenIdentifier);
    request.set("dat1", card.hash);
    if (!pin) return request;
    const auto pipe = service::pipeHolding(*pin);
    if (!pipe) return std::nullopt;
    request.set("dat2", *pipe);
    return request;
}

LoginAnswer readLogin(const std::optional<Message>& reply) {
    if (!reply)
        return {PAM_AUTH_ERR,
                "The service for smart cards has not answered. Take the card out and try again."};
    const auto status = reply->integer("res");
    if (!status || *status > 0) return {PAM_SYSTEM_ERR};
    if (*status == status::kPinLocked) return {PAM_MAXTRIES, errorText(*reply)};
    if (*status != status::kSuccess) return {PAM_AUTH_ERR, errorText(*reply)};
    LoginAnswer answer{PAM_SUCCESS};
    if (const auto pipe = reply->endpoint("dat1")) answer.unlockKey = service::secretIn(*pipe);
    const auto* why = reply->text("str1");
    answer.text = why ? platform::harmlessText(*why, kMostTextCharacters) : "";
    return answer;
}

}  // namespace vlm::pam
