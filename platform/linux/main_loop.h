// MainLoop: the loop that this process's main queue is worked off in.
//
// A process either lets it run, or has the loop of a toolkit drive it: that one calls dispatch()
// once, and then whenever the descriptor is readable.
//
// Ownership: work that is not done goes with the loop.
// Threads:   one thread runs or drives it; any may hand in work and end it.
// Blocking:  run() until the end; everything else never.
// Errors:    a machine that has no room for a loop is told in the log, and run() fails.
// In tests:  tests/integration/linux/main_loop_test.cpp

#pragma once

#include <chrono>
#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <mutex>
#include <optional>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/sd_event_handles.h"

namespace vlm::platform {

class MainLoop {
public:
    using Work = std::function<void()>;

    MainLoop();
    MainLoop(const MainLoop&) = delete;
    MainLoop& operator=(const MainLoop&) = delete;

    // Until the end; the process's exit status.
    int run();

    // The same, for as long as this answers true: it is asked before each turn. None when the loop
    // has not ended then.
    std::optional<int> runWhile(const std::function<bool()>& goesOn);

    // Ends the loop with this status, after the work that was handed in before.
    void end(int status);

    // For what has descriptors and signals of its own on this loop; null when there is no loop.
    sd_event* event() const { return _event.get(); }

    int descriptor() const;

    // Does a turn of what is due; the exit status when the loop has ended. The descriptor stays
    // readable while there is more.
    std::optional<int> dispatch();

    void add(Work work);
    void addAfter(std::chrono::milliseconds delay, Work work);

private:
    using Clock = std::chrono::steady_clock;

    static int onWork(sd_event_source* source, int descriptor, std::uint32_t events, void* loop);
    static int onTime(sd_event_source* source, std::uint64_t now, void* loop);
    void awaitNextTime();
    std::optional<int> endedWith() const;

    SdEvent _event;
    FileDescriptor _waiting;  // counts the works that wait
    SdEventSource _onWork;
    SdEventSource _onTime;

    std::multimap<Clock::time_point, Work> _later;  // the loop's thread only

    std::mutex _mutex;
    std::deque<Work> _works;  // any thread, under the mutex
};

}  // namespace vlm::platform
