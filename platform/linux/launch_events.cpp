#include "platform/linux/launch_events.h"

#include <systemd/sd-daemon.h>

#include <cerrno>
#include <system_error>

#include "platform/linux/session_bus_notifications.h"

namespace vlm::platform {

namespace {

std::string reasonOf(int result) {
    if (result == -ENOMEDIUM) return "there is no session bus";
    if (result == -EEXIST) return "it runs already";
    return std::generic_category().message(-result);
}

}  // namespace

std::string LaunchEvents::open(sd_event* event) {
    static const sd_bus_vtable kMethods[] = {
        SD_BUS_VTABLE_START(0),
        SD_BUS_METHOD(kDeliverMethod, "s", "", &LaunchEvents::onDeliver,
                      SD_BUS_VTABLE_UNPRIVILEGED),
        SD_BUS_VTABLE_END,
    };
    sd_bus* opened = nullptr;
    int result = sd_bus_open_user(&opened);
    _bus.reset(opened);
    if (result >= 0) result = sd_bus_set_exit_on_disconnect(opened, 1);
    if (result >= 0)
        result = sd_bus_add_object_vtable(opened, nullptr, kNotificationsObject,
                                          kNotificationsInterface, kMethods, this);
    if (result >= 0) result = sd_bus_attach_event(opened, event, SD_EVENT_PRIORITY_NORMAL);
    if (result >= 0) result = sd_bus_request_name(opened, kNotificationsService, 0);
    return result < 0 ? reasonOf(result) : "";
}

// First the manager of services is told, so that it starts a new process and does not end this one
// for the loss of its name. The bus answers in the order in which it delivers: what comes for the
// name comes before that answer.
void LaunchEvents::leave() {
    refuse();
    if (!_bus) return;
    sd_notify(0, "STOPPING=1");
    sd_bus_release_name(_bus.get(), kNotificationsService);
    while (sd_bus_process(_bus.get(), nullptr) > 0) {
    }
    sd_bus_detach_event(_bus.get());
    _bus.reset();
}

int LaunchEvents::onDeliver(sd_bus_message* delivery, void* events, sd_bus_error* error) {
    auto& self = *static_cast<LaunchEvents*>(events);
    const char* name = nullptr;
    const int result = sd_bus_message_read_basic(delivery, 's', &name);
    if (result < 0) return result;
    if (self._isRefusing)
        return sd_bus_error_set(error, kLeavingError, "This process is about to end; post again");
    self._handler(name);
    return sd_bus_reply_method_return(delivery, "");
}

}  // namespace vlm::platform
