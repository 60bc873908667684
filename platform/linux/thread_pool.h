// ThreadPool: a few threads that are there while there is work for them.
//
// A thread is started for work that no other one is free for, and ends when it had none for a
// while, so that a quiet process has none and wakes up for none.
//
// Ownership: work that was not begun goes with the pool; work that was is waited for.
// Threads:   any may hand in work.
// In tests:  tests/integration/linux/thread_pool_test.cpp

#pragma once

#include <chrono>
#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>

namespace vlm::platform {

class ThreadPool {
public:
    using Work = std::function<void()>;

    ThreadPool(unsigned most, std::chrono::milliseconds patience)
        : _most(most), _patience(patience) {}
    ~ThreadPool();
    ThreadPool(const ThreadPool&) = delete;
    ThreadPool& operator=(const ThreadPool&) = delete;

    void add(Work work);

private:
    void startThread();
    void work();
    bool awaitWork(std::unique_lock<std::mutex>& lock);

    const unsigned _most;
    const std::chrono::milliseconds _patience;  // of a thread without work

    std::mutex _mutex;  // for everything below
    std::condition_variable _news;
    std::condition_variable _allEnded;
    std::deque<Work> _works;
    unsigned _threads = 0;
    unsigned _free = 0;  // threads that wait for work
    bool _ending = false;
};

}  // namespace vlm::platform
