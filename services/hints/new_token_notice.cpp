#include "services/hints/new_token_notice.h"

#include <algorithm>
#include <iterator>
#include <vector>

namespace vlm::service {

void NewTokenNotice::looked(const Tokens& tokens, bool isCertain) {
    _in = tokens;
    _isCertain = isCertain;
    forgetThoseGone();
    tell();
    if (isCertain) _isCardPulled = false;
}

void NewTokenNotice::pcscdWent() {
    _areReadersAway = true;
    _timer.reset();
}

void NewTokenNotice::pcscdCame() {
    if (!_areReadersAway) return;
    _timer = _parts.callAfter(kUntilReadersAreBack, [this] {
        _areReadersAway = false;
        forgetThoseGone();
    });
}

void NewTokenNotice::forgetThoseGone() {
    if (!_isCardPulled && (!_isCertain || _areReadersAway)) return;
    std::erase_if(_told, [this](const std::string& token) { return !_in.contains(token); });
}

void NewTokenNotice::tell() {
    std::vector<std::string> untold;
    std::ranges::set_difference(_in, _told, std::back_inserter(untold));
    if (untold.empty() || !_parts.isUserAtConsole()) return;
    for (const auto& token : untold) {
        _told.insert(token);
        _parts.post();
    }
}

}  // namespace vlm::service
