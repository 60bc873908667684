#include "platform/linux/thread_pool.h"

#include <system_error>
#include <thread>
#include <utility>

#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {
constexpr Log kLog(kTokenFramework, "vlmbind");
}

ThreadPool::~ThreadPool() {
    std::unique_lock lock(_mutex);
    _ending = true;
    _news.notify_all();
    _allEnded.wait(lock, [this] { return _threads == 0; });
}

void ThreadPool::add(Work work) {
    const std::lock_guard lock(_mutex);
    _works.push_back(std::move(work));
    if (_free < _works.size() && _threads < _most) startThread();
    _news.notify_one();
}

// Without a thread the work waits for one that is free, or for the next work that comes.
void ThreadPool::startThread() {
    try {
        std::thread([this] { this->work(); }).detach();
        ++_threads;
    } catch (const std::system_error& error) {
        kLog.error("No thread can be started for work in the background: {}", error.what());
    }
}

void ThreadPool::work() {
    std::unique_lock lock(_mutex);
    while (awaitWork(lock)) {
        Work next = std::move(_works.front());
        _works.pop_front();
        lock.unlock();
        next();
        next = nullptr;  // what it held may take its time to go
        lock.lock();
    }
    --_threads;
    // Under the mutex: the pool may be gone as soon as it is free.
    if (_threads == 0) _allEnded.notify_all();
}

bool ThreadPool::awaitWork(std::unique_lock<std::mutex>& lock) {
    ++_free;
    _news.wait_for(lock, _patience, [this] { return _ending || !_works.empty(); });
    --_free;
    return !_ending && !_works.empty();
}

}  // namespace vlm::platform
