#include "services/hints/card_removal.h"

#include "services/hints/new_token_notice.h"

namespace vlm::service {

void CardRemoval::looked(const Tokens& tokens, bool isCertain) {
    _in = tokens;
    if (_areReadersAway) return;
    _seen.insert(tokens.begin(), tokens.end());
    if (!isCertain) return;
    const bool hasCardMoved = std::exchange(_hasCardMoved, false);
    const auto seen = std::exchange(_seen, tokens);
    if (!hasCardMoved) return;
    for (const auto& token : seen)
        if (!tokens.contains(token)) _parts.removed(token);
}

void CardRemoval::pcscdWent() {
    _areReadersAway = true;
    _hasCardMoved = false;
    _timer.reset();
}

void CardRemoval::pcscdCame() {
    if (!_areReadersAway) return;
    _timer = _parts.callAfter(NewTokenNotice::kUntilReadersAreBack, [this] {
        _areReadersAway = false;
        _seen = _in;
    });
}

}  // namespace vlm::service
