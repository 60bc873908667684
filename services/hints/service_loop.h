#pragma once

#include <systemd/sd-event.h>

#include <memory>
#include <string>

namespace vlm::service {

// The event loop that everything in this program runs on. SIGTERM and SIGINT end it with 0.
class ServiceLoop {
public:
    ServiceLoop();

    // Null when the system has no room for one.
    sd_event* get() const { return _event.get(); }

    // Runs until the loop is ended; the program's exit status.
    int run();

    // Ends the loop, as a success.
    void end();

    // Ends the loop as a failure, with one line in the log.
    void fail(const std::string& reason);

private:
    struct EventUnref {
        void operator()(sd_event* event) const { sd_event_unref(event); }
    };

    std::unique_ptr<sd_event, EventUnref> _event;
};

}  // namespace vlm::service
