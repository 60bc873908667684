#include "tests/integration/linux/bus_thread.h"

#include <poll.h>
#include <sys/eventfd.h>

#include <array>

namespace vlm::test {

BusThread::BusThread(sd_bus* bus)
    : _bus(bus), _stop(::eventfd(0, EFD_CLOEXEC)), _thread([this] { run(); }) {}

BusThread::~BusThread() {
    ::eventfd_write(_stop.get(), 1);
    _thread.join();
}

void BusThread::run() {
    for (;;) {
        const int result = sd_bus_process(_bus, nullptr);
        if (result < 0) return;
        if (result > 0) continue;
        std::array<pollfd, 2> waiting{
            {{_stop.get(), POLLIN, 0},
             {sd_bus_get_fd(_bus), static_cast<short>(sd_bus_get_events(_bus)), 0}}};
        if (::poll(waiting.data(), waiting.size(), -1) > 0 && waiting[0].revents != 0) return;
    }
}

}  // namespace vlm::test
