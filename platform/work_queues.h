// WorkQueues: work that is done later or elsewhere.
//
// The main queue is the loop that every window lives on. Work on it is done one after another, in
// the order in which it was handed in; delayed work joins that order when its time has come.
// Background work is done on threads of a small shared pool, side by side.
//
// Ownership: a queue owns work until it is done. Work that may outlive what it is about holds that
//            weakly.
// Threads:   any may hand work in.
// Blocking:  handing in never does. Work on the main queue must not block either: windows wait for
//            it.
// Errors:    none. Work that is left when the process ends is not done.
// Behind it: platform/linux/event_loop_work_queues.h
// In tests:  tests/fakes/fake_work_queues.h, tests/contracts/work_queues_contract.h

#pragma once

#include <chrono>
#include <functional>

namespace vlm::platform {

class WorkQueues {
public:
    using Work = std::function<void()>;

    virtual ~WorkQueues() = default;

    virtual void runOnMain(Work work) = 0;
    virtual void runOnMainAfter(std::chrono::milliseconds delay, Work work) = 0;
    virtual void runInBackground(Work work) = 0;
};

}  // namespace vlm::platform
