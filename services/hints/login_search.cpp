#include "services/hints/login_search.h"

#include <utility>

#include "services/hints/login_card_flags.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

std::int64_t bit(LoginCardFlag flag) { return static_cast<std::int64_t>(flag); }

std::int64_t flagsOf(const Token& token) {
    std::int64_t flags = token.hasPinPad ? bit(LoginCardFlag::PinPad) : 0;
    if (token.pinState == PinState::FewTriesLeft) flags |= bit(LoginCardFlag::FewTriesLeft);
    if (token.pinState == PinState::LastTry) flags |= bit(LoginCardFlag::LastTry);
    return flags;
}

}  // namespace

void LoginSearch::start() {
    _session.check(_request, [this](const std::optional<Refusal>& refusal) {
        if (refusal) return std::exchange(_done, nullptr)(*refusal);
        look();
    });
}

void LoginSearch::look() {
    _tokens.list([weak = weak_from_this()](const std::vector<Token>& inserted) {
        if (const auto self = weak.lock()) self->choose(inserted);
    });
}

void LoginSearch::choose(const std::vector<Token>& inserted) {
    const auto card = _request.account.empty() ? _policy.cardOfAnybody(inserted)
                                               : _policy.cardOf(_request.account, inserted);
    const auto done = std::exchange(_done, nullptr);
    if (!card) return done(card.refusal());
    done(described(*card));
}

platform::Message LoginSearch::described(const LoginCard& card) const {
    auto reply = numberReply(status::kSuccess);
    auto flags = flagsOf(card.token);
    if (_policy.requiresCard(card.account)) flags |= bit(LoginCardFlag::CardRequired);
    reply.set("str1", card.account);
    reply.set("str2", card.token.identifier);
    reply.set("str3", card.token.name);
    reply.set("dat1", card.identity.publicKeyHash);
    reply.set("num1", flags);
    return reply;
}

}  // namespace vlm::service
