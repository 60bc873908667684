// Work queues whose time is moved by hand, and whose work is done when a test says so.

#pragma once

#include <deque>
#include <map>
#include <mutex>
#include <string>
#include <utility>

#include "platform/work_queues.h"

namespace vlm::fakes {

// Work may be handed in on any thread; the thread of the test does all of it.
class FakeWorkQueues final : public platform::WorkQueues {
public:
    // What a test does to the world. Work that is handed in meanwhile is done as well.
    void runMain() { runAll(_main); }
    void runBackground() { runAll(_background); }

    // The next work on the main queue alone; false when there is none.
    bool runNextOnMain() { return runNext(_main); }

    // Delayed work whose time comes joins the main queue, earliest first.
    void advanceBy(std::chrono::milliseconds time) {
        const std::lock_guard lock(_mutex);
        _now += time;
        moveDueWork();
    }

    // Until the next delayed work is due; false when there is none.
    bool advanceToNext() {
        const std::lock_guard lock(_mutex);
        if (_later.empty()) return false;
        _now = _later.begin()->first;
        moveDueWork();
        return true;
    }

    // What is due and was not done, in words; empty when that is nothing.
    std::string leftBehind() const {
        const std::lock_guard lock(_mutex);
        if (_main.empty() && _background.empty()) return "";
        return std::to_string(_main.size()) + " on the main queue, " +
               std::to_string(_background.size()) + " in the background";
    }

    void runOnMain(Work work) override {
        const std::lock_guard lock(_mutex);
        _main.push_back(std::move(work));
    }

    void runOnMainAfter(std::chrono::milliseconds delay, Work work) override {
        const std::lock_guard lock(_mutex);
        _later.emplace(_now + delay, std::move(work));
        moveDueWork();
    }

    void runInBackground(Work work) override {
        const std::lock_guard lock(_mutex);
        _background.push_back(std::move(work));
    }

private:
    void moveDueWork() {
        const auto due = _later.upper_bound(_now);
        for (auto each = _later.begin(); each != due; ++each)
            _main.push_back(std::move(each->second));
        _later.erase(_later.begin(), due);
    }

    void runAll(std::deque<Work>& queue) {
        while (runNext(queue)) {
        }
    }

    bool runNext(std::deque<Work>& queue) {
        Work work;
        {
            const std::lock_guard lock(_mutex);
            if (queue.empty()) return false;
            work = std::move(queue.front());
            queue.pop_front();
        }
        work();
        return true;
    }

    mutable std::mutex _mutex;  // for everything below
    std::deque<Work> _main;
    std::deque<Work> _background;
    std::multimap<std::chrono::milliseconds, Work> _later;  // by the time when it is due
    std::chrono::milliseconds _now{0};
};

}  // namespace vlm::fakes
