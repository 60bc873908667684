#pragma once

#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "platform/linux/token_handlers.h"
#include "platform/token_watcher.h"

namespace vlm::fakes {

// Tokens that a test inserts and pulls. The watchers learn of it, and call their handlers, when the
// test delivers it, on the thread that does.
class FakeTokenFramework final : public platform::TokenFramework {
public:
    // What a test does to the world.
    void insert(const std::string& token) {
        const std::lock_guard lock(_mutex);
        if (!_tokens.insert(token).second) return;
        tell([token](platform::TokenHandlers& handlers) { handlers.insert(token); });
    }
    void pull(const std::string& token) {
        const std::lock_guard lock(_mutex);
        if (_tokens.erase(token) == 0) return;
        tell([token](platform::TokenHandlers& handlers) { handlers.remove(token); });
    }

    // Everything that is due, also what becomes due by it. Not by a handler.
    void deliver() {
        for (bool isDue = true; isDue;) {
            isDue = false;
            for (const auto& watched : inUse()) isDue = watched->deliver() || isDue;
        }
    }

    // How many watchers there are.
    std::size_t watchers() { return inUse().size(); }

    std::shared_ptr<platform::TokenWatcher> watchTokens() override {
        const auto watched = std::make_shared<Watched>();
        const std::lock_guard lock(_mutex);
        watched->add(
            [tokens = _tokens](platform::TokenHandlers& handlers) { handlers.replace(tokens); });
        _watched.push_back(watched);
        return std::make_shared<FakeTokenWatcher>(watched);
    }

private:
    using Change = std::function<void(platform::TokenHandlers&)>;

    // What a watcher has to hear. A delivery may outlive the watcher.
    class Watched {
    public:
        platform::TokenHandlers handlers{[this] { add(&platform::TokenHandlers::callDue); }};

        void add(Change change) {
            const std::lock_guard lock(_mutex);
            _changes.push_back(std::move(change));
        }
        // Whether there was anything.
        bool deliver() {
            std::unique_lock lock(_mutex);
            const auto changes = std::exchange(_changes, {});
            lock.unlock();
            for (const auto& change : changes) change(handlers);
            return !changes.empty();
        }

    private:
        std::mutex _mutex;
        std::deque<Change> _changes;
    };

    class FakeTokenWatcher final : public platform::TokenWatcher {
    public:
        explicit FakeTokenWatcher(std::shared_ptr<Watched> watched)
            : _watched(std::move(watched)) {}
        FakeTokenWatcher(const FakeTokenWatcher&) = delete;
        FakeTokenWatcher& operator=(const FakeTokenWatcher&) = delete;
        ~FakeTokenWatcher() override { _watched->handlers.letGo(); }

        std::vector<std::string> tokenIds() const override { return _watched->handlers.tokenIds(); }
        void setInsertionHandler(Handler handler) override {
            _watched->handlers.setInsertionHandler(std::move(handler));
        }
        void addRemovalHandler(const std::string& token, Handler handler) override {
            _watched->handlers.addRemovalHandler(token, std::move(handler));
        }

    private:
        const std::shared_ptr<Watched> _watched;
    };

    void tell(const Change& change) {
        for (const auto& each : _watched)
            if (const auto watched = each.lock()) watched->add(change);
    }
    std::vector<std::shared_ptr<Watched>> inUse() {
        const std::lock_guard lock(_mutex);
        std::erase_if(_watched, [](const auto& each) { return each.expired(); });
        std::vector<std::shared_ptr<Watched>> all;
        for (const auto& each : _watched)
            if (auto watched = each.lock()) all.push_back(std::move(watched));
        return all;
    }

    std::mutex _mutex;
    std::set<std::string> _tokens;
    std::vector<std::weak_ptr<Watched>> _watched;
};

}  // namespace vlm::fakes
