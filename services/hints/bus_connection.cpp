#include "services/hints/bus_connection.h"

#include <cerrno>
#include <cstring>
#include <utility>

#include "platform/text.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

constexpr const char* kBusName = "org.freedesktop.DBus";
constexpr const char* kBusPath = "/org/freedesktop/DBus";

Refusal cannotOpen(BusKind kind, int code) {
    return {status::kUnreachable,
            platform::text("the {} bus cannot be reached ({})",
                           kind == BusKind::System ? "system" : "session", std::strerror(-code))};
}

}  // namespace

Outcome<std::unique_ptr<BusConnection>> BusConnection::open(sd_event* event, BusKind kind,
                                                            Lost lost) {
    sd_bus* opened = nullptr;
    const int code =
        kind == BusKind::System ? sd_bus_open_system(&opened) : sd_bus_open_user(&opened);
    if (code < 0) return cannotOpen(kind, code);
    std::unique_ptr<BusConnection> connection(
        new BusConnection(platform::SdBus(opened), std::move(lost)));
    if (const int attached = sd_bus_attach_event(opened, event, SD_EVENT_PRIORITY_NORMAL);
        attached < 0)
        return cannotOpen(kind, attached);
    if (!connection->match("org.freedesktop.DBus.Local", "/org/freedesktop/DBus/Local",
                           "org.freedesktop.DBus.Local", "Disconnected", onDisconnected,
                           connection->_disconnected))
        return cannotOpen(kind, -EIO);
    return connection;
}

std::string BusConnection::claim(const std::string& name) {
    _name = name;
    if (!match(kBusName, kBusPath, kBusName, "NameLost", onNameLost, _nameLost))
        return platform::text("the bus does not tell about the name {}", name);
    const int code = sd_bus_request_name(_bus.get(), name.c_str(), 0);
    if (code >= 0) return {};
    if (code == -EEXIST) return platform::text("another program has the name {} on the bus", name);
    if (code == -EACCES || code == -EPERM)
        return platform::text("the policy of the bus does not give the name {} to this user", name);
    return platform::text("the bus does not give the name {} ({})", name, std::strerror(-code));
}

// The bus answers on the same way on which it delivers, so the answer comes after the last call.
void BusConnection::release(std::function<void()> released) {
    _released = std::move(released);
    // It tells about this loss too.
    _nameLost.reset();
    sd_bus_slot* slot = nullptr;
    const int code = sd_bus_release_name_async(_bus.get(), &slot, _name.c_str(), onReleased, this);
    if (code < 0)
        return _lost(
            platform::text("the name {} cannot be given back ({})", _name, std::strerror(-code)));
    _release.reset(slot);
}

bool BusConnection::match(const char* sender, const char* path, const char* interface,
                          const char* member, sd_bus_message_handler_t handler,
                          platform::SdBusSlot& slot) {
    sd_bus_slot* made = nullptr;
    if (sd_bus_match_signal(_bus.get(), &made, sender, path, interface, member, handler, this) < 0)
        return false;
    slot.reset(made);
    return true;
}

int BusConnection::onDisconnected(sd_bus_message*, void* self, sd_bus_error*) {
    static_cast<BusConnection*>(self)->_lost("the connection to the bus was lost");
    return 0;
}

int BusConnection::onNameLost(sd_bus_message* signal, void* self, sd_bus_error*) {
    auto& connection = *static_cast<BusConnection*>(self);
    const char* name = nullptr;
    if (sd_bus_message_read(signal, "s", &name) < 0 || connection._name != name) return 0;
    connection._lost(platform::text("the name {} on the bus was lost", name));
    return 0;
}

int BusConnection::onReleased(sd_bus_message* reply, void* self, sd_bus_error*) {
    auto& connection = *static_cast<BusConnection*>(self);
    if (const auto* error = sd_bus_message_get_error(reply))
        connection._lost(platform::text("the bus does not take the name {} back ({})",
                                        connection._name,
                                        error->message ? error->message : error->name));
    else
        std::exchange(connection._released, nullptr)();
    return 0;
}

}  // namespace vlm::service
