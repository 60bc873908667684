// BusConnection: this program's connection to one bus, driven by the event loop.
//
// Ownership: the loop outlives it; everything that is put on the bus goes before it.
// Errors:    a sentence's end that says why. When the bus or the claimed name is lost, the handler
//            is called, with the reason.

#pragma once

#include <systemd/sd-bus.h>

#include <functional>
#include <memory>
#include <string>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/outcome.h"

namespace vlm::service {

enum class BusKind { System, Session };

class BusConnection {
public:
    using Lost = std::function<void(const std::string& reason)>;

    static Outcome<std::unique_ptr<BusConnection>> open(sd_event* event, BusKind kind, Lost lost);

    BusConnection(const BusConnection&) = delete;
    BusConnection& operator=(const BusConnection&) = delete;

    sd_bus* get() const { return _bus.get(); }

    // From the return of this on, callers find this program. Why it may not have the name; empty
    // when it has.
    std::string claim(const std::string& name);

    // Gives the name back. Calls once, when the bus has done so and all that came for the name has
    // been handed out; later callers do not find this program, and the bus may start another.
    void release(std::function<void()> released);

private:
    BusConnection(platform::SdBus bus, Lost lost) : _bus(std::move(bus)), _lost(std::move(lost)) {}

    static int onDisconnected(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onNameLost(sd_bus_message* signal, void* self, sd_bus_error* error);
    static int onReleased(sd_bus_message* reply, void* self, sd_bus_error* error);
    bool match(const char* sender, const char* path, const char* interface, const char* member,
               sd_bus_message_handler_t handler, platform::SdBusSlot& slot);

    platform::SdBus _bus;
    Lost _lost;
    std::string _name;
    platform::SdBusSlot _disconnected;
    platform::SdBusSlot _nameLost;
    std::function<void()> _released;
    platform::SdBusSlot _release;
};

}  // namespace vlm::service
