#include "platform/linux/send_notification.h"

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/session_bus_notifications.h"

namespace vlm::platform {

int sendNotification(sd_bus* bus, const std::string& name) {
    sd_bus_message* made = nullptr;
    int result =
        sd_bus_message_new_method_call(bus, &made, kNotificationsService, kNotificationsObject,
                                       kNotificationsInterface, kDeliverMethod);
    const SdBusMessage delivery(made);
    if (result >= 0) result = sd_bus_message_append_basic(made, 's', name.c_str());
    // Nothing comes back, so what the receiver does with it is not waited for.
    if (result >= 0) result = sd_bus_message_set_expect_reply(made, 0);
    return result < 0 ? result : sd_bus_send(bus, made, nullptr);
}

}  // namespace vlm::platform
