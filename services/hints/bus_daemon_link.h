#pragma once

#include <systemd/sd-event.h>

#include "services/hints/daemon_link.h"

namespace vlm::service {

// A call has a connection of its own, so that the daemon sees it end.
class BusDaemonLink final : public DaemonLink {
public:
    explicit BusDaemonLink(sd_event* event) : _event(event) {}

    std::unique_ptr<Call> exchange(const platform::Message& request, Answer answer) override;

private:
    sd_event* _event;
};

}  // namespace vlm::service
