// PrompterRegistry: which users have an instance of this service that asks them for PINs on their
// desktop, and where on the bus it is.
//
// An instance registers itself with RegisterPrompter(), as what the bus says its user is; the
// latest of a user counts, until it leaves the bus.
//
// Ownership: the bus and the watch outlive it. Threads: the event loop's.
// Errors:    none.
// In tests:  tests/integration/service/user_instance_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <map>
#include <memory>
#include <optional>
#include <string>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/caller.h"

namespace vlm::service {

class PrompterRegistry {
public:
    PrompterRegistry(sd_bus* bus, CallerWatch& callers) : _bus(bus), _callers(callers) {}
    PrompterRegistry(const PrompterRegistry&) = delete;
    PrompterRegistry& operator=(const PrompterRegistry&) = delete;

    // Puts RegisterPrompter() on the bus. False when the bus does not take it.
    bool start();

    // The unique name of the user's instance on the bus.
    std::optional<std::string> prompterOf(platform::UserId user) const;

private:
    struct Prompter {
        std::string connection;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    static int onRegister(sd_bus_message* call, void* self, sd_bus_error* error);
    void add(platform::UserId user, const std::string& connection);

    static const sd_bus_vtable kMembers[];

    sd_bus* _bus;
    CallerWatch& _callers;
    platform::SdBusSlot _slot;
    std::map<platform::UserId, Prompter> _prompters;
};

}  // namespace vlm::service
