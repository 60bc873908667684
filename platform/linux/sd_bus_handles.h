// Owners of sd-bus objects, one per handle type, used by the platform and by the services.

#pragma once

#include <systemd/sd-bus.h>

#include <memory>

namespace vlm::platform {

// Sends what is still queued and closes the connection.
struct SdBusClose {
    void operator()(sd_bus* bus) const { sd_bus_flush_close_unref(bus); }
};
using SdBus = std::unique_ptr<sd_bus, SdBusClose>;

// Closes the connection with what is still queued, and so never waits for the bus.
struct SdBusLeave {
    void operator()(sd_bus* bus) const { sd_bus_close_unref(bus); }
};
using LeavingSdBus = std::unique_ptr<sd_bus, SdBusLeave>;

struct SdBusMessageUnref {
    void operator()(sd_bus_message* message) const { sd_bus_message_unref(message); }
};
using SdBusMessage = std::unique_ptr<sd_bus_message, SdBusMessageUnref>;

// A registration (of an object, a match, an outstanding call), undone with the handle.
struct SdBusSlotUnref {
    void operator()(sd_bus_slot* slot) const { sd_bus_slot_unref(slot); }
};
using SdBusSlot = std::unique_ptr<sd_bus_slot, SdBusSlotUnref>;

struct SdBusCredsUnref {
    void operator()(sd_bus_creds* credentials) const { sd_bus_creds_unref(credentials); }
};
using SdBusCreds = std::unique_ptr<sd_bus_creds, SdBusCredsUnref>;

// An error that a call fills in.
class SdBusError {
public:
    SdBusError() = default;
    ~SdBusError() { sd_bus_error_free(&_error); }
    SdBusError(const SdBusError&) = delete;
    SdBusError& operator=(const SdBusError&) = delete;

    sd_bus_error* get() { return &_error; }
    bool isSet() const { return sd_bus_error_is_set(&_error) != 0; }
    bool is(const char* name) const { return sd_bus_error_has_name(&_error, name) != 0; }
    const char* name() const { return _error.name ? _error.name : ""; }
    const char* message() const { return _error.message ? _error.message : ""; }

private:
    sd_bus_error _error{};
};

}  // namespace vlm::platform
