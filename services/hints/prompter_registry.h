// PrompterRegistry: which users have an instance of this service that asks them for PINs on their
// desktop, and where on the bus it is.
//
// The instances do not start a daemon: they register when they see one come. So one that was
// started by somebody's request waits a moment for them before there is nobody to ask.
//
// An instance registers itself with RegisterPrompter(), as what the bus says its user is; the
// latest of a user counts, until it leaves the bus.
//
// Ownership: the bus and the watch outlive it. Threads: the event loop's.
// Errors:    none.
// In tests:  tests/integration/service/user_instance_test.cpp, caller_pin_prompt_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/bus_caller.h"
#include "services/hints/caller.h"

namespace vlm::service {

class PrompterRegistry {
public:
    // Milliseconds of a clock that never goes back.
    using Clock = std::function<std::int64_t()>;
    static constexpr std::chrono::milliseconds kTimeToRegister{2'000};

    using Waiting = std::shared_ptr<const std::function<void()>>;

    PrompterRegistry(sd_bus* bus, CallerWatch& watch, Clock clock)
        : _bus(bus), _watch(watch), _clock(std::move(clock)) {}
    PrompterRegistry(const PrompterRegistry&) = delete;
    PrompterRegistry& operator=(const PrompterRegistry&) = delete;

    // Puts RegisterPrompter() on the bus. False when the bus does not take it. The time to register
    // counts from here.
    bool start();

    // The unique name of the user's instance on the bus.
    std::optional<std::string> prompterOf(platform::UserId user) const;

    // How long an instance that saw the daemon come may still take to register; zero when that is
    // over.
    std::chrono::milliseconds timeLeftToRegister() const;

    // Calls once, when the user's instance registers, unless the returned object is gone by then.
    Waiting callWhenRegistered(platform::UserId user, std::function<void()> call);

private:
    struct Prompter {
        std::string connection;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    static int onRegister(sd_bus_message* call, void* self, sd_bus_error* error);
    void add(platform::UserId user, const std::string& connection);

    static const sd_bus_vtable kMembers[];

    sd_bus* _bus;
    CallerWatch& _watch;
    const Clock _clock;
    std::int64_t _registrationEnds = 0;
    platform::SdBusSlot _slot;
    KnownCallers _callers;
    std::map<platform::UserId, Prompter> _prompters;
    std::multimap<platform::UserId, std::weak_ptr<const std::function<void()>>> _waiting;
};

}  // namespace vlm::service
