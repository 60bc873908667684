// The agent's process on the session bus, under the manager of services, in the toolkit's loop.

#pragma once

#include <atomic>
#include <mutex>
#include <optional>

#include "platform/application.h"
#include "platform/linux/launch_events.h"
#include "platform/linux/loaded_windowing.h"
#include "platform/linux/main_loop.h"

namespace vlm::platform {

class DesktopApplication final : public Application {
public:
    DesktopApplication(MainLoop& loop, LoadedWindowing& windowing)
        : _loop(loop), _windowing(windowing) {}

    void setEventHandler(EventHandler handler) override { _handler = std::move(handler); }
    int run() override;
    void exit(int status) override;
    std::unique_ptr<Transaction> openTransaction() override;

private:
    class Counted;

    static int onTerminate(sd_event_source* source, const signalfd_siginfo* info, void* self);
    bool takeSignals();
    void closeTransaction();

    MainLoop& _loop;
    LoadedWindowing& _windowing;
    EventHandler _handler;
    std::optional<LaunchEvents> _events;  // made before any other thread
    SdEventSource _onTerminate;
    std::atomic<bool> _isEnding = false;

    std::mutex _mutex;  // for everything below
    int _openTransactions = 0;
    bool _isAskedToEnd = false;
};

}  // namespace vlm::platform
