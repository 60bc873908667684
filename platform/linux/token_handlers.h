// TokenHandlers: the tokens that a watcher was told of, and the handlers that hear of them.
//
// A change is put in by the watcher's own thread, and the handler that it concerns runs at once. A
// handler that is set hears of what is there with the next callDue(), for which the watcher is
// woken; changes that come before that are among it, so that each token is told once.
//
// Threads:   the second group belongs to the watcher's own thread, the first may be called on any,
//            also by a handler.
// Blocking:  letGo() waits for a handler that runs, but not when that handler calls it.

#pragma once

#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "platform/token_watcher.h"

namespace vlm::platform {

class TokenHandlers {
public:
    using Handler = TokenWatcher::Handler;

    // Calls `wake`, on any thread, when the watcher's thread has something due.
    explicit TokenHandlers(std::function<void()> wake) : _wake(std::move(wake)) {}
    TokenHandlers(const TokenHandlers&) = delete;
    TokenHandlers& operator=(const TokenHandlers&) = delete;

    std::vector<std::string> tokenIds() const;
    void setInsertionHandler(Handler handler);
    void addRemovalHandler(const std::string& token, Handler handler);
    // The handlers go. After this none runs, and none will.
    void letGo();

    // What handlers that were set since have to hear.
    void callDue();
    void insert(const std::string& token);
    void remove(const std::string& token);
    // What differs from these, removals first.
    void replace(const std::set<std::string>& tokens);

private:
    using Due = std::vector<std::pair<std::string, Handler>>;

    void callRemovals();
    void callNewInsertionHandler();
    void call(std::unique_lock<std::mutex>& lock, Handler handler, const std::string& token);

    const std::function<void()> _wake;

    mutable std::mutex _mutex;
    std::condition_variable _handlerEnded;
    std::thread::id _calling;  // where a handler runs; nowhere when none does
    bool _isLetGo = false;
    std::set<std::string> _tokens;
    Handler _insertion;
    bool _isInsertionNew = false;  // and has not heard of the tokens that are there
    std::map<std::string, Handler> _removals;
    Due _dueRemovals;  // of tokens that were not there when the handler was added
};

}  // namespace vlm::platform
