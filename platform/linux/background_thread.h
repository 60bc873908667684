#pragma once

#include <pthread.h>

#include <csignal>
#include <thread>
#include <utility>

namespace vlm::platform {

// A thread that takes no signals: those are the program's own, which may not even know of it.
template <typename Work>
std::thread startBackgroundThread(Work work) {
    sigset_t all;
    sigset_t before;
    sigfillset(&all);
    pthread_sigmask(SIG_SETMASK, &all, &before);
    std::thread thread(std::move(work));
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
    return thread;
}

}  // namespace vlm::platform
