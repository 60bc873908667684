// Polkit, which is asked about the caller's connection to the bus: it finds the process and the
// session itself, and nobody can put another process in their place.
//
// A person is waited for for ten minutes; then the question is withdrawn.

#pragma once

#include <systemd/sd-bus.h>

#include <chrono>
#include <cstdint>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/authority.h"

namespace vlm::service {

class PolkitAuthority final : public Authority {
public:
    static constexpr std::chrono::minutes kPatience{10};

    // The bus is attached to an event loop; both outlive this and every question.
    explicit PolkitAuthority(sd_bus* bus, std::chrono::milliseconds patience = kPatience)
        : _bus(bus), _patience(patience) {}
    PolkitAuthority(const PolkitAuthority&) = delete;
    PolkitAuthority& operator=(const PolkitAuthority&) = delete;

    std::unique_ptr<Question> ask(const RightQuestion& question, Answer answer) override;

    // From now on, because the daemon is about to end. Open questions stay.
    void askNobody() { _isEnding = true; }

private:
    sd_bus* _bus;
    const std::chrono::milliseconds _patience;
    std::uint64_t _lastQuestion = 0;
    bool _isEnding = false;
};

}  // namespace vlm::service
