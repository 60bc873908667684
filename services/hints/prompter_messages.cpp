#include "services/hints/prompter_messages.h"

#include <cstdint>
#include <string>

#include "platform/token_framework.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

constexpr std::size_t kMostName = 4096;
constexpr std::size_t kMostPin = 256;

PinAnswer unavailable(std::string reason) {
    return {PinAnswer::Outcome::Unavailable, {}, std::move(reason)};
}

}  // namespace

platform::Message writeQuestion(const PinQuestion& question) {
    platform::Message message;
    message.set("card", question.card);
    message.set("identity", question.identity);
    message.set("state", static_cast<std::uint64_t>(question.state));
    message.set("account", question.account);
    return message;
}

std::optional<PinQuestion> readQuestion(const platform::Message& message) {
    const auto* card = message.text("card");
    const auto* identity = message.text("identity");
    const auto state = message.unsignedInteger("state");
    const auto* account = message.text("account");
    const auto isName = [](const std::string* text) { return text && text->size() <= kMostName; };
    if (!isName(card) || !isName(identity) || !isName(account) || !state ||
        *state > static_cast<std::uint64_t>(PinState::Locked))
        return std::nullopt;
    return PinQuestion{*card, *identity, static_cast<PinState>(*state), *account, {}};
}

platform::Message writeAnswer(const PinAnswer& answer) {
    switch (answer.outcome) {
        case PinAnswer::Outcome::Given: {
            auto message = numberReply(status::kSuccess);
            message.set("pin", std::string(answer.pin.text()));
            return message;
        }
        case PinAnswer::Outcome::Cancelled:
            return refusalReply({status::kCancelled, "the PIN prompt was cancelled"});
        case PinAnswer::Outcome::TimedOut:
            return refusalReply({status::kCancelled, "no PIN was entered in time"});
        case PinAnswer::Outcome::Unavailable:
            break;
    }
    return refusalReply({status::kNoPin, answer.reason});
}

PinAnswer readAnswer(const platform::Message& message) {
    const auto result = message.integer("res");
    const auto* pin = message.text("pin");
    if (result == status::kSuccess && pin && !pin->empty() && pin->size() <= kMostPin)
        return {PinAnswer::Outcome::Given, Secret(*pin), {}};
    if (result == status::kCancelled) return {PinAnswer::Outcome::Cancelled, {}, {}};
    std::optional<platform::Error> error;
    if (!platform::decodeReplyError(message, &error) && error)
        return unavailable(error->description());
    return unavailable("the answer of the user's own hints service cannot be understood");
}

}  // namespace vlm::service
