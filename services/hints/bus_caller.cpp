#include "services/hints/bus_caller.h"

#include "platform/linux/sd_bus_handles.h"

namespace vlm::service {

namespace {

std::optional<Caller> askAbout(sd_bus_message* call, const char* sender) {
    sd_bus_creds* asked = nullptr;
    if (sd_bus_query_sender_creds(call, SD_BUS_CREDS_EUID | SD_BUS_CREDS_PID, &asked) < 0)
        return std::nullopt;
    const platform::SdBusCreds credentials(asked);
    uid_t user = 0;
    if (sd_bus_creds_get_euid(asked, &user) < 0) return std::nullopt;
    Caller caller{user, 0, sender};
    // Only a terminal is found by it, and a caller can do without.
    if (sd_bus_creds_get_pid(asked, &caller.process) < 0) caller.process = 0;
    return caller;
}

}  // namespace

std::optional<Caller> KnownCallers::senderOf(sd_bus_message* call) {
    const char* sender = sd_bus_message_get_sender(call);
    if (!sender) return std::nullopt;
    if (const auto known = _known.find(sender); known != _known.end()) return known->second;
    auto caller = askAbout(call, sender);
    if (!caller) return std::nullopt;
    if (_known.size() == kMost) _known.clear();
    _known.emplace(sender, *caller);
    return caller;
}

}  // namespace vlm::service
