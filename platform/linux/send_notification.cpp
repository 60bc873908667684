#include "platform/linux/send_notification.h"

#include <cstdint>

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/session_bus_notifications.h"

namespace vlm::platform {

int sendNotification(sd_bus* bus, const std::string& name, sd_bus_message_handler_t onAnswer) {
    sd_bus_message* made = nullptr;
    int result =
        sd_bus_message_new_method_call(bus, &made, kNotificationsService, kNotificationsObject,
                                       kNotificationsInterface, kDeliverMethod);
    const SdBusMessage delivery(made);
    if (result >= 0) result = sd_bus_message_append_basic(made, 's', name.c_str());
    if (result < 0) return result;
    if (onAnswer) return sd_bus_call_async(bus, nullptr, made, onAnswer, nullptr, UINT64_MAX);
    result = sd_bus_message_set_expect_reply(made, 0);
    return result < 0 ? result : sd_bus_send(bus, made, nullptr);
}

}  // namespace vlm::platform
