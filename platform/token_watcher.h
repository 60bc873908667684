// TokenWatcher: tells of tokens that come and go.
//
// A handler that is set hears of the tokens that are there already, then of each that comes. Tokens
// that leave and come back are told again. What happens while the service behind it is away is told
// when it is back: the watcher never gives up.
//
// Shapes:    a token is named by its identifier, as the hints service names it.
// Ownership: with the last reference to a watcher its handlers go; none is called after that.
// Threads:   handlers are called on the watcher's own thread, one after another. Everything may be
//            called on any thread, also by a handler.
// Blocking:  never; letting go of a watcher waits for a handler that runs on another thread.
// Errors:    none; a service that cannot be reached is told in the log.
// Behind it: platform/linux/bus_token_watcher.h
// In tests:  tests/fakes/fake_token_framework.h, tests/contracts/token_watcher_contract.h

#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace vlm::platform {

class TokenWatcher {
public:
    using Handler = std::function<void(const std::string& token)>;

    virtual ~TokenWatcher() = default;

    // Those that were told as inserted and not yet as removed, sorted.
    virtual std::vector<std::string> tokenIds() const = 0;

    // Replaces the handler that was set before.
    virtual void setInsertionHandler(Handler handler) = 0;

    // For one token, and once: called when it leaves, at once when it is not there. Replaces the
    // handler that was set for this token before.
    virtual void addRemovalHandler(const std::string& token, Handler handler) = 0;
};

class TokenFramework {
public:
    virtual ~TokenFramework() = default;

    // A new watcher. Never null: a service that is not there is waited for.
    virtual std::shared_ptr<TokenWatcher> watchTokens() = 0;
};

}  // namespace vlm::platform
