// NewTokenNotice: decides when the desktop's agent is told that a token was inserted.
//
// It is told once for each token that comes, and for those that are in at the start. A token that
// is not seen counts as gone only when a card was pulled, or when that is certain: a daemon that
// was just started may not have read it yet, and a pcscd that restarts takes its readers along and
// brings them back. What comes while the user is not at the console is told when the user is back,
// if it is still in then: the agent would open its window on a screen that nobody sees.
//
// Ownership: what its parts refer to outlives it. Threads: the event loop's. Blocking: never.
// In tests:  tests/unit/services/new_token_notice_test.cpp

#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <utility>

namespace vlm::service {

class NewTokenNotice {
public:
    using Duration = std::chrono::milliseconds;
    using Tokens = std::set<std::string>;

    struct Parts {
        std::function<bool()> isUserAtConsole;
        std::function<void()> post;
        // Calls once, after the delay, unless the returned object is gone by then.
        std::function<std::shared_ptr<void>(Duration delay, std::function<void()> call)> callAfter;
    };

    // How long a pcscd that has come back may take to find its readers and the cards in them.
    static constexpr Duration kUntilReadersAreBack = std::chrono::seconds(10);

    explicit NewTokenNotice(Parts parts) : _parts(std::move(parts)) {}
    NewTokenNotice(const NewTokenNotice&) = delete;
    NewTokenNotice& operator=(const NewTokenNotice&) = delete;

    // The tokens that the daemon knows, and whether those are certainly all.
    void looked(const Tokens& tokens, bool isCertain);

    // The user has come to the console or left it.
    void consoleChanged() { tell(); }

    // One left its reader, and the next looks tell which.
    void cardPulled() { _isCardPulled = true; }

    void pcscdWent();
    void pcscdCame();

private:
    void forgetThoseGone();
    void tell();

    Parts _parts;
    Tokens _in;    // at the last look
    Tokens _told;  // and not certainly gone since
    bool _isCertain = false;
    bool _isCardPulled = false;
    bool _areReadersAway = false;
    std::shared_ptr<void> _timer;
};

}  // namespace vlm::service
