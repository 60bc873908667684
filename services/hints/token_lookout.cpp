#include "services/hints/token_lookout.h"

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <vector>

#include "platform/property_list.h"
#include "platform/token_framework.h"
#include "services/hints/hints_log.h"
#include "services/hints/request.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

platform::Message question() {
    platform::Message request;
    request.set("op", static_cast<std::uint64_t>(Operation::TokenInfo));
    request.set("uid", std::int64_t{-1});
    request.set("num1", std::int64_t{1});
    return request;
}

std::optional<Refusal> refusalIn(const platform::Message& reply) {
    std::optional<platform::Error> error;
    if (platform::decodeReplyError(reply, &error)) return std::nullopt;
    return Refusal{error->code, error->description()};
}

// The tokens of the record; none when the reply has no record.
std::optional<std::set<std::string>> tokensIn(const platform::Message& reply) {
    const auto* bytes = reply.bytes("res");
    const auto list = bytes ? platform::readPropertyList(*bytes) : std::nullopt;
    const auto* context = list && list->dictionary() ? list->dictionary()->find("ctx") : nullptr;
    if (!context || !context->bytes()) return std::nullopt;
    const auto record = platform::readPropertyList(*context->bytes());
    const auto* entries = record ? record->dictionary() : nullptr;
    const auto* names = entries ? entries->find("ftn") : nullptr;
    if (!names || !names->dictionary()) return std::nullopt;
    std::set<std::string> tokens;
    for (const auto& [token, name] : *names->dictionary()) tokens.insert(token);
    return tokens;
}

LookAgain lookAgainIn(const platform::Message& reply) {
    switch (reply.integer("num1").value_or(0)) {
        case static_cast<std::int64_t>(LookAgain::Soon):
            return LookAgain::Soon;
        case static_cast<std::int64_t>(LookAgain::NowAndThen):
            return LookAgain::NowAndThen;
        default:
            return LookAgain::OnCardEvent;
    }
}

}  // namespace

TokenLookout::TokenLookout(Parts parts) : _parts(std::move(parts)) { look(); }

void TokenLookout::cardEvent() {
    _isEventNew = true;
    if (!_call) look();
}

void TokenLookout::setWatched(bool isWatched) {
    if (isWatched && !_isWatched) cardEvent();
    _isWatched = isWatched;
}

void TokenLookout::look() {
    if (std::exchange(_isEventNew, false)) {
        _needsSecondLook = true;
        _looksAtASlowCard = 0;
        _triesInVain = 0;
        _slowPause.reset();
    } else {
        _needsSecondLook = false;
    }
    _timer.reset();
    _call = _parts.daemon.exchange(question(), [this](const Outcome<platform::Message>& outcome) {
        const auto ended = std::move(_call);
        take(outcome);
        _parts.looked();
    });
}

void TokenLookout::take(const Outcome<platform::Message>& outcome) {
    if (!outcome) return failed(outcome.refusal());
    if (const auto refusal = refusalIn(*outcome)) return failed(*refusal);
    auto tokens = tokensIn(*outcome);
    if (!tokens) return failed({status::kUnreachable, "The daemon's answer cannot be understood."});
    _failurePause.reset();
    _triesInVain = 0;
    if (std::exchange(_isFailing, false)) kLog.notice("the daemon tells the inserted cards again");
    const auto lookAgain = lookAgainIn(*outcome);
    _isCertain = !_isEventNew && !_needsSecondLook && lookAgain != LookAgain::Soon;
    tellDifferences(std::move(*tokens));
    planNextLook(lookAgain);
}

void TokenLookout::failed(const Refusal& refusal) {
    _isCertain = false;
    if (!std::exchange(_isFailing, true))
        kLog.error("the inserted cards are not known: {} ({})", refusal.text, refusal.status);
    if (_isWatched || _triesInVain++ < kMostTriesUnwatched) lookAfter(_failurePause.next());
}

void TokenLookout::tellDifferences(Tokens now) {
    std::vector<std::string> left;
    std::vector<std::string> came;
    std::ranges::set_difference(_tokens, now, std::back_inserter(left));
    std::ranges::set_difference(now, _tokens, std::back_inserter(came));
    _tokens = std::move(now);
    for (const auto& token : left) _parts.removed(token);
    for (const auto& token : came) _parts.inserted(token);
}

void TokenLookout::planNextLook(LookAgain lookAgain) {
    if (_isEventNew) return look();
    if (lookAgain == LookAgain::Soon && _looksAtASlowCard < kMostLooksAtASlowCard) {
        ++_looksAtASlowCard;
        return lookAfter(_slowPause.next());
    }
    if (_needsSecondLook) return lookAfter(kUntilSecondLook);
    if (lookAgain == LookAgain::NowAndThen && _isWatched) lookAfter(kNowAndThen);
}

void TokenLookout::lookAfter(Duration pause) {
    _timer = _parts.callAfter(pause, [this] { look(); });
}

}  // namespace vlm::service
