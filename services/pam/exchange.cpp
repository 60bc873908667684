#include "services/pam/exchange.h"

#include "platform/linux/sd_bus_call.h"
#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/sd_bus_message.h"
#include "services/hints/service_names.h"

namespace vlm::pam {

namespace {

platform::LeavingSdBus openBus(const std::string& address) {
    sd_bus* made = nullptr;
    if (sd_bus_new(&made) < 0) return nullptr;
    platform::LeavingSdBus bus(made);
    const bool isStarted = sd_bus_set_address(made, address.c_str()) >= 0 &&
                           sd_bus_set_bus_client(made, 1) >= 0 && sd_bus_start(made) >= 0;
    return isStarted ? std::move(bus) : nullptr;
}

platform::SdBusMessage callOf(sd_bus* bus, const platform::Message& request) {
    sd_bus_message* made = nullptr;
    if (sd_bus_message_new_method_call(bus, &made, service::kDaemonName, service::kObjectPath,
                                       service::kHintsInterface, "Exchange") < 0)
        return nullptr;
    platform::SdBusMessage call(made);
    std::string reason;
    return platform::appendDictionary(made, request, reason) ? std::move(call) : nullptr;
}

}  // namespace

Exchange exchangeOn(const std::string& busAddress) {
    return [busAddress](const platform::Message& request,
                        std::chrono::seconds patience) -> std::optional<platform::Message> {
        const auto bus = openBus(busAddress);
        const auto call = bus ? callOf(bus.get(), request) : nullptr;
        platform::SdBusMessage answer;
        if (!call || platform::callAndWait(bus.get(), call.get(), patience, answer) < 0 ||
            sd_bus_message_get_error(answer.get()))
            return std::nullopt;
        std::string reason;
        auto reply = platform::readDictionary(answer.get(), reason);
        if (!reply) return platform::Message();
        return std::move(reply->message);
    };
}

}  // namespace vlm::pam
