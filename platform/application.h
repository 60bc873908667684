// Application: this process as an agent of the desktop, started when a notification is posted for
// it and run by the desktop's loop until its work is done.
//
// Ownership: a transaction is closed by letting go of it.
// Threads:   the handler is set and run() is called on the main queue's thread; the rest on any.
// Blocking:  run() until the end; the rest never.
// Errors:    where no notification can be received, run() fails, and the reason is in the log.
// Behind it: platform/linux/desktop_application.h
// In tests:  tests/fakes/fake_application.h, tests/integration/agent/

#pragma once

#include <functional>
#include <memory>
#include <string>

namespace vlm::platform {

class Application {
public:
    using EventHandler = std::function<void(const std::string& notification)>;

    // While one is open, a process that is asked to end does so only when it is closed.
    class Transaction {
    public:
        virtual ~Transaction() = default;
    };

    // The process could not begin to receive notifications.
    static constexpr int kFailed = 255;

    virtual ~Application() = default;

    // Called on the main queue with the name of each notification for this program.
    virtual void setEventHandler(EventHandler handler) = 0;

    // The main queue's loop, which is the toolkit's once there is a window. The process's exit
    // status.
    virtual int run() = 0;

    // Ends the loop with this status. From here on no notification is handed over: what still
    // comes is for the process that the desktop starts next.
    virtual void exit(int status) = 0;

    virtual std::unique_ptr<Transaction> openTransaction() = 0;
};

}  // namespace vlm::platform
