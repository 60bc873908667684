#include "platform/linux/event_loop_work_queues.h"

#include "platform/platform.h"

namespace vlm::platform {

namespace {

EventLoopWorkQueues& workQueuesOfThisProcess() {
    static auto& queues = *new EventLoopWorkQueues;
    return queues;
}

}  // namespace

MainLoop& mainLoop() { return workQueuesOfThisProcess().mainLoop(); }

WorkQueues& Platform::workQueues() { return workQueuesOfThisProcess(); }

}  // namespace vlm::platform
