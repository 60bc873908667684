// Work queues on an event loop and a pool of threads.

#pragma once

#include "platform/linux/main_loop.h"
#include "platform/linux/thread_pool.h"
#include "platform/work_queues.h"

namespace vlm::platform {

class EventLoopWorkQueues final : public WorkQueues {
public:
    static constexpr unsigned kMostThreads = 4;
    static constexpr std::chrono::seconds kThreadPatience{5};

    MainLoop& mainLoop() { return _mainLoop; }

    void runOnMain(Work work) override { _mainLoop.add(std::move(work)); }
    void runOnMainAfter(std::chrono::milliseconds delay, Work work) override {
        _mainLoop.addAfter(delay, std::move(work));
    }
    void runInBackground(Work work) override { _threads.add(std::move(work)); }

private:
    MainLoop _mainLoop;
    ThreadPool _threads{kMostThreads, kThreadPatience};  // goes first: its work uses the loop
};

// The loop of this process's main queue, for the program that runs or drives it.
MainLoop& mainLoop();

}  // namespace vlm::platform
