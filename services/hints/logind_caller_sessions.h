// The sessions of systemd-logind: what it publishes in files, and what only it knows, which it is
// asked for on the bus.
//
// A program that the user's own systemd started (the bus activates agents that way) belongs to no
// session; the session that its user has a screen in stands for it.

#pragma once

#include <systemd/sd-bus.h>

#include "services/hints/caller_sessions.h"

namespace vlm::service {

class LogindCallerSessions final : public CallerSessions {
public:
    // The bus is attached to an event loop; both outlive this and every question.
    explicit LogindCallerSessions(sd_bus* bus) : _bus(bus) {}

    std::unique_ptr<Question> ask(const Caller& caller, Answer answer) override;

private:
    sd_bus* _bus;
};

}  // namespace vlm::service
