#include "platform/linux/desktop_application.h"

#include <csignal>
#include <cstdlib>

#include "platform/linux/event_loop_work_queues.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "vlmbind");

}  // namespace

class DesktopApplication::Counted final : public Transaction {
public:
    explicit Counted(DesktopApplication& application) : _application(application) {}
    ~Counted() override { _application.closeTransaction(); }
    Counted(const Counted&) = delete;
    Counted& operator=(const Counted&) = delete;

private:
    DesktopApplication& _application;
};

// The toolkit comes with the first window, in the middle of the loop, and takes over from there.
int DesktopApplication::run() {
    _events.emplace(_handler);
    const auto reason = takeSignals() ? _events->open(_loop.event()) : "there is no main loop";
    if (!reason.empty()) {
        kLog.error("The agent cannot receive notifications: {}", reason);
        return kFailed;
    }
    const auto ended = _loop.runWhile([this] { return !_windowing.isLoaded(); });
    return ended ? *ended : _windowing.drive(_loop);
}

// The signal is blocked before there is any other thread, which all inherit that.
bool DesktopApplication::takeSignals() {
    sigset_t terminate;
    sigemptyset(&terminate);
    sigaddset(&terminate, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &terminate, nullptr);
    sd_event_source* source = nullptr;
    const int result = _loop.event() ? sd_event_add_signal(_loop.event(), &source, SIGTERM,
                                                           &DesktopApplication::onTerminate, this)
                                     : -1;
    _onTerminate.reset(source);
    return result >= 0;
}

void DesktopApplication::exit(int status) {
    if (_isEnding.exchange(true)) return;
    _events->refuse();
    _loop.add([this] { _events->leave(); });
    _loop.end(status);
}

std::unique_ptr<Application::Transaction> DesktopApplication::openTransaction() {
    const std::lock_guard lock(_mutex);
    ++_openTransactions;
    return std::make_unique<Counted>(*this);
}

void DesktopApplication::closeTransaction() {
    {
        const std::lock_guard lock(_mutex);
        if (--_openTransactions > 0 || !_isAskedToEnd) return;
    }
    exit(EXIT_SUCCESS);
}

int DesktopApplication::onTerminate(sd_event_source*, const signalfd_siginfo*, void* self) {
    auto& application = *static_cast<DesktopApplication*>(self);
    {
        const std::lock_guard lock(application._mutex);
        application._isAskedToEnd = true;
        if (application._openTransactions > 0) return 0;
    }
    application.exit(EXIT_SUCCESS);
    return 0;
}

Application& Platform::application() {
    static auto& service = *new DesktopApplication(mainLoop(), loadedWindowing());
    return service;
}

}  // namespace vlm::platform
