#include "platform/linux/bus_token_watcher.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>

#include <atomic>
#include <thread>
#include <utility>

#include "platform/linux/background_thread.h"
#include "platform/linux/file_descriptor.h"
#include "platform/linux/sd_event_handles.h"
#include "platform/linux/token_handlers.h"
#include "platform/linux/token_service_link.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "tokens");

// What a watcher and its thread share. The thread may be the one that lets go of the watcher, and
// then outlives it for a moment.
class Watching {
public:
    TokenHandlers handlers{[this] { wake(); }};

    // Until end() is called.
    void run();
    void end() {
        handlers.letGo();
        _isEnded = true;
        wake();
    }

private:
    static int onWoken(sd_event_source* source, int descriptor, std::uint32_t, void* self);

    void wake() const { eventfd_write(_wake.get(), 1); }

    const FileDescriptor _wake{eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)};
    std::atomic<bool> _isEnded = false;
};

void Watching::run() {
    sd_event* made = nullptr;
    int result = sd_event_new(&made);
    const SdEvent event(made);
    if (result >= 0)
        result = sd_event_add_io(made, nullptr, _wake.get(), EPOLLIN, &Watching::onWoken, this);
    if (result < 0) return kLog.error("The system has no room to watch which tokens come and go.");
    TokenServiceLink link(made, {.all = [this](const auto& tokens) { handlers.replace(tokens); },
                                 .inserted = [this](const auto& token) { handlers.insert(token); },
                                 .removed = [this](const auto& token) { handlers.remove(token); }});
    link.start();
    sd_event_loop(made);
}

int Watching::onWoken(sd_event_source* source, int descriptor, std::uint32_t, void* self) {
    auto& watching = *static_cast<Watching*>(self);
    eventfd_t times = 0;
    eventfd_read(descriptor, &times);
    if (watching._isEnded) return sd_event_exit(sd_event_source_get_event(source), 0);
    watching.handlers.callDue();
    return 0;
}

class BusTokenWatcher final : public TokenWatcher {
public:
    BusTokenWatcher() = default;
    BusTokenWatcher(const BusTokenWatcher&) = delete;
    BusTokenWatcher& operator=(const BusTokenWatcher&) = delete;
    ~BusTokenWatcher() override {
        _watching->end();
        if (_thread.get_id() == std::this_thread::get_id())
            _thread.detach();
        else
            _thread.join();
    }

    std::vector<std::string> tokenIds() const override { return _watching->handlers.tokenIds(); }
    void setInsertionHandler(Handler handler) override {
        _watching->handlers.setInsertionHandler(std::move(handler));
    }
    void addRemovalHandler(const std::string& token, Handler handler) override {
        _watching->handlers.addRemovalHandler(token, std::move(handler));
    }

private:
    const std::shared_ptr<Watching> _watching = std::make_shared<Watching>();
    std::thread _thread = startBackgroundThread([watching = _watching] { watching->run(); });
};

}  // namespace

std::shared_ptr<TokenWatcher> BusTokenFramework::watchTokens() {
    return std::make_shared<BusTokenWatcher>();
}

TokenFramework& Platform::tokenFramework() {
    static auto& service = *new BusTokenFramework;
    return service;
}

}  // namespace vlm::platform
