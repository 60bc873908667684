// CardRemoval: decides when a card was certainly pulled out.
//
// A token that is not listed may still be in: its module may have failed, the daemon may have been
// started anew, pcscd may take its readers along and bring them back. So a token was removed when
// it had been listed, a card or its reader has moved, and the tokens that are certain lack it. For
// a while after pcscd went, nothing counts.
//
// Ownership: what its parts refer to outlives it. Threads: the event loop's. Blocking: never.
// In tests:  tests/unit/services/card_removal_test.cpp

#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <utility>

namespace vlm::service {

class CardRemoval {
public:
    using Duration = std::chrono::milliseconds;
    using Tokens = std::set<std::string>;

    struct Parts {
        std::function<void(const std::string& token)> removed;
        // Calls once, after the delay, unless the returned object is gone by then.
        std::function<std::shared_ptr<void>(Duration delay, std::function<void()> call)> callAfter;
    };

    explicit CardRemoval(Parts parts) : _parts(std::move(parts)) {}
    CardRemoval(const CardRemoval&) = delete;
    CardRemoval& operator=(const CardRemoval&) = delete;

    // The tokens that the daemon knows, and whether those are certainly all.
    void looked(const Tokens& tokens, bool isCertain);

    // A card has come or gone, or a reader with one.
    void cardMoved() { _hasCardMoved = !_areReadersAway; }

    void pcscdWent();
    void pcscdCame();

private:
    Parts _parts;
    Tokens _in;    // at the last look
    Tokens _seen;  // and not certainly gone since
    bool _hasCardMoved = false;
    bool _areReadersAway = false;
    std::shared_ptr<void> _timer;
};

}  // namespace vlm::service
