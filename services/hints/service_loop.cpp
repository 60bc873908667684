#include "services/hints/service_loop.h"

#include <csignal>
#include <cstdlib>

#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

void ignore(int signal) {
    struct sigaction ignoring = {};
    ignoring.sa_handler = SIG_IGN;
    sigaction(signal, &ignoring, nullptr);
}

}  // namespace

ServiceLoop::ServiceLoop() {
    sigset_t ending;
    sigemptyset(&ending);
    sigaddset(&ending, SIGTERM);
    sigaddset(&ending, SIGINT);
    sigprocmask(SIG_BLOCK, &ending, nullptr);
    ignore(SIGPIPE);
    // Started in the background of a shell, the service puts terminals right that it does not own.
    ignore(SIGTTOU);

    sd_event* made = nullptr;
    if (sd_event_new(&made) < 0) return;
    _event.reset(made);
    // Without a handler a signal ends the loop.
    if (sd_event_add_signal(made, nullptr, SIGTERM, nullptr, nullptr) < 0 ||
        sd_event_add_signal(made, nullptr, SIGINT, nullptr, nullptr) < 0)
        _event.reset();
}

int ServiceLoop::run() {
    const int status = sd_event_loop(_event.get());
    return status < 0 ? EXIT_FAILURE : status;
}

void ServiceLoop::end() { sd_event_exit(_event.get(), EXIT_SUCCESS); }

void ServiceLoop::fail(const std::string& reason) {
    kLog.error("ending: {}", reason);
    sd_event_exit(_event.get(), EXIT_FAILURE);
}

}  // namespace vlm::service
