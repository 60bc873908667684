// BusThread: runs a connection of the test's own on a thread, until it goes.
//
// The connection is the thread's alone while that runs.

#pragma once

#include <thread>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/sd_bus_handles.h"

namespace vlm::test {

class BusThread {
public:
    explicit BusThread(sd_bus* bus);
    ~BusThread();
    BusThread(const BusThread&) = delete;
    BusThread& operator=(const BusThread&) = delete;

private:
    void run();

    sd_bus* const _bus;
    const platform::FileDescriptor _stop;
    std::thread _thread;
};

}  // namespace vlm::test
