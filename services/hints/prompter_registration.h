// PrompterRegistration: tells the daemon that this instance asks its user for PINs, now and each
// time that a daemon starts. It starts none itself.
//
// Ownership: the bus outlives it. Threads: the event loop's. Blocking: never.
// Errors:    a registration that fails is one log line; the daemon then has no way to the desktop.
// In tests:  tests/integration/service/user_instance_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include "platform/linux/sd_bus_handles.h"

namespace vlm::service {

class PrompterRegistration {
public:
    explicit PrompterRegistration(sd_bus* systemBus) : _bus(systemBus) {}
    PrompterRegistration(const PrompterRegistration&) = delete;
    PrompterRegistration& operator=(const PrompterRegistration&) = delete;

    // False when the bus does not tell when the daemon starts.
    bool start();

private:
    static int onOwnerChanged(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onRegistered(sd_bus_message* reply, void* self, sd_bus_error* error);
    void registerNow();

    sd_bus* _bus;
    platform::SdBusSlot _ownerChanged;
    platform::SdBusSlot _call;
};

}  // namespace vlm::service
