// Tokens that come and go as a test says. Handlers are called on the thread of whoever says it.

#pragma once

#include <algorithm>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "platform/token_watcher.h"

namespace vlm {

class ScriptedWatcher final : public platform::TokenWatcher {
public:
    explicit ScriptedWatcher(std::set<std::string> present) : _present(std::move(present)) {}

    void insert(const std::string& token) {
        Handler handler;
        {
            const std::lock_guard lock(_mutex);
            _present.insert(token);
            handler = _inserted;
        }
        if (handler) handler(token);
    }

    // Tells also of a token that is not there, when somebody waits for that: news may come late.
    void remove(const std::string& token) {
        Handler handler;
        {
            const std::lock_guard lock(_mutex);
            _present.erase(token);
            handler = std::exchange(_removed[token], nullptr);
        }
        if (handler) handler(token);
    }

    bool awaitsRemovalOf(const std::string& token) {
        const std::lock_guard lock(_mutex);
        return _removed[token] != nullptr;
    }

    // A handler that somebody already calls when its watcher goes.
    Handler insertionHandler() const {
        const std::lock_guard lock(_mutex);
        return _inserted;
    }
    Handler removalHandler(const std::string& token) {
        const std::lock_guard lock(_mutex);
        return _removed[token];
    }

    std::vector<std::string> tokenIds() const override {
        const std::lock_guard lock(_mutex);
        return {_present.begin(), _present.end()};
    }

    void setInsertionHandler(Handler handler) override {
        {
            const std::lock_guard lock(_mutex);
            _inserted = handler;
        }
        for (const auto& token : tokenIds()) handler(token);
    }

    void addRemovalHandler(const std::string& token, Handler handler) override {
        {
            const std::lock_guard lock(_mutex);
            if (_present.contains(token)) {
                _removed[token] = std::move(handler);
                return;
            }
        }
        handler(token);
    }

private:
    mutable std::mutex _mutex;  // for everything below
    std::set<std::string> _present;
    Handler _inserted;
    std::map<std::string, Handler> _removed;
};

class ScriptedTokens final : public platform::TokenFramework {
public:
    std::shared_ptr<platform::TokenWatcher> watchTokens() override {
        ++watchersMade;
        auto made = std::make_shared<ScriptedWatcher>(present);
        watcher = made;
        return made;
    }

    std::set<std::string> present;  // when a watcher is made
    int watchersMade = 0;
    std::weak_ptr<ScriptedWatcher> watcher;  // the last one
};

}  // namespace vlm
