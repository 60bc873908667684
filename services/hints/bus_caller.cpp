#include "services/hints/bus_caller.h"

#include "platform/linux/sd_bus_handles.h"

namespace vlm::service {

std::optional<Caller> callerOf(sd_bus_message* call) {
    sd_bus_creds* asked = nullptr;
    if (sd_bus_query_sender_creds(call, SD_BUS_CREDS_EUID | SD_BUS_CREDS_PID, &asked) < 0)
        return std::nullopt;
    const platform::SdBusCreds credentials(asked);
    const char* sender = sd_bus_message_get_sender(call);
    uid_t user = 0;
    if (!sender || sd_bus_creds_get_euid(asked, &user) < 0) return std::nullopt;
    Caller caller{user, 0, sender};
    // Only a terminal is found by it, and a caller can do without.
    if (sd_bus_creds_get_pid(asked, &caller.process) < 0) caller.process = 0;
    return caller;
}

}  // namespace vlm::service
