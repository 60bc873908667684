#include "platform/linux/token_handlers.h"

#include <algorithm>
#include <iterator>

namespace vlm::platform {

std::vector<std::string> TokenHandlers::tokenIds() const {
    const std::lock_guard lock(_mutex);
    return {_tokens.begin(), _tokens.end()};
}

// What a handler holds may be the last of something that calls back here, so handlers never go
// under the lock.
void TokenHandlers::setInsertionHandler(Handler handler) {
    {
        const std::lock_guard lock(_mutex);
        if (_isLetGo) return;
        std::swap(_insertion, handler);
        _isInsertionNew = true;
    }
    _wake();
}

void TokenHandlers::addRemovalHandler(const std::string& token, Handler handler) {
    {
        const std::lock_guard lock(_mutex);
        if (_isLetGo) return;
        if (_tokens.contains(token)) {
            std::swap(_removals[token], handler);
            return;
        }
        const auto due = std::ranges::find(_dueRemovals, token, &Due::value_type::first);
        if (due == _dueRemovals.end())
            _dueRemovals.emplace_back(token, std::move(handler));
        else
            std::swap(due->second, handler);
    }
    _wake();
}

void TokenHandlers::letGo() {
    Handler insertion;
    std::map<std::string, Handler> removals;
    Due dueRemovals;
    std::unique_lock lock(_mutex);
    _isLetGo = true;
    insertion.swap(_insertion);
    removals.swap(_removals);
    dueRemovals.swap(_dueRemovals);
    if (_calling == std::this_thread::get_id()) return lock.unlock();
    _handlerEnded.wait(lock, [this] { return _calling == std::thread::id(); });
    lock.unlock();
}

void TokenHandlers::callDue() {
    callRemovals();
    callNewInsertionHandler();
}

void TokenHandlers::callRemovals() {
    std::unique_lock lock(_mutex);
    for (auto left = _dueRemovals.size(); left > 0 && !_dueRemovals.empty(); --left) {
        auto [token, handler] = std::move(_dueRemovals.front());
        _dueRemovals.erase(_dueRemovals.begin());
        call(lock, std::move(handler), token);
    }
}

void TokenHandlers::callNewInsertionHandler() {
    std::unique_lock lock(_mutex);
    if (!_isInsertionNew) return;
    _isInsertionNew = false;
    const auto tokens = _tokens;
    for (const auto& token : tokens) {
        // One that takes this one's place hears of all of them itself.
        if (_isInsertionNew) return;
        call(lock, _insertion, token);
    }
}

void TokenHandlers::insert(const std::string& token) {
    std::unique_lock lock(_mutex);
    if (_tokens.insert(token).second && !_isInsertionNew) call(lock, _insertion, token);
}

void TokenHandlers::remove(const std::string& token) {
    std::unique_lock lock(_mutex);
    if (_tokens.erase(token) == 0) return;
    if (auto entry = _removals.extract(token)) call(lock, std::move(entry.mapped()), token);
}

void TokenHandlers::replace(const std::set<std::string>& tokens) {
    std::vector<std::string> left;
    std::vector<std::string> came;
    const auto before = tokenIds();
    std::ranges::set_difference(before, tokens, std::back_inserter(left));
    std::ranges::set_difference(tokens, before, std::back_inserter(came));
    for (const auto& token : left) remove(token);
    for (const auto& token : came) insert(token);
}

// The handler runs, and goes, without the lock. It is a copy: it may be replaced while it runs,
// also by itself.
void TokenHandlers::call(std::unique_lock<std::mutex>& lock, Handler handler,
                         const std::string& token) {
    const bool isWanted = handler && !_isLetGo;
    if (isWanted) _calling = std::this_thread::get_id();
    lock.unlock();
    if (isWanted) handler(token);
    handler = nullptr;
    lock.lock();
    if (!isWanted) return;
    _calling = {};
    _handlerEnded.notify_all();
}

}  // namespace vlm::platform
