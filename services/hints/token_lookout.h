// TokenLookout: keeps an eye on the tokens that the daemon knows, and tells the differences.
//
// It looks when it is made, when a card event comes, and a second after that once more: the first
// answer may be from a reading that began before the event. While the daemon says that a card is
// being read, it looks again after pauses that grow, a bounded number of times; a card that takes
// longer is given up until the next event. Otherwise it waits, and nothing wakes it.
//
// While somebody watches, it does more: where a token may come unannounced, it looks now and then,
// and a daemon that cannot be reached is tried again without an end. While nobody does, such a
// daemon is given up as a slow card is.
//
// Ownership: its parts outlive it. It may not be destroyed by what it calls.
// Threads:   the event loop's. Blocking: never.
// Errors:    a daemon that cannot be reached, or refuses, is one log line until it answers again.
//            What is known stays.
// In tests:  tests/unit/services/token_lookout_test.cpp

#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>

#include "platform/linux/growing_pause.h"
#include "services/hints/daemon_link.h"
#include "services/hints/tokens.h"

namespace vlm::service {

class TokenLookout {
public:
    using Duration = std::chrono::milliseconds;
    using Tokens = std::set<std::string>;

    struct Parts {
        DaemonLink& daemon;
        // Calls once, after the delay, unless the returned object is gone by then.
        std::function<std::shared_ptr<void>(Duration delay, std::function<void()> call)> callAfter;
        std::function<void(const std::string& token)> inserted;
        std::function<void(const std::string& token)> removed;
        // After each look, whatever became of it.
        std::function<void()> looked;
    };

    static constexpr Duration kUntilSecondLook = std::chrono::seconds(1);
    static constexpr Duration kLongestPause = std::chrono::seconds(4);
    // With the five seconds that each may take, longer than the daemon lets a card be read.
    static constexpr int kMostLooksAtASlowCard = 10;
    static constexpr int kMostTriesUnwatched = 10;
    static constexpr Duration kNowAndThen = std::chrono::seconds(2);

    explicit TokenLookout(Parts parts);
    TokenLookout(const TokenLookout&) = delete;
    TokenLookout& operator=(const TokenLookout&) = delete;

    // Those that were told as inserted and not yet as removed.
    const Tokens& tokens() const { return _tokens; }

    // Whether the tokens are all that are in: no card was being read at the last look, and no
    // second look is to come.
    bool isCertain() const { return _isCertain; }

    // A card or a reader has come or gone.
    void cardEvent();

    // Somebody begins to watch, and it looks, for what came unannounced; or nobody does any more.
    void setWatched(bool isWatched);

private:
    void look();
    void take(const Outcome<platform::Message>& outcome);
    void failed(const Refusal& refusal);
    void tellDifferences(Tokens now);
    void planNextLook(LookAgain lookAgain);
    void lookAfter(Duration pause);

    Parts _parts;
    Tokens _tokens;
    std::unique_ptr<DaemonLink::Call> _call;
    std::shared_ptr<void> _timer;

    bool _isEventNew = true;  // and the look that is under way, if any, may not show it
    bool _needsSecondLook = false;
    bool _isWatched = false;
    bool _isCertain = false;
    int _looksAtASlowCard = 0;
    int _triesInVain = 0;
    platform::GrowingPause _slowPause{kUntilSecondLook, kLongestPause};
    platform::GrowingPause _failurePause;
    bool _isFailing = false;
};

}  // namespace vlm::service
