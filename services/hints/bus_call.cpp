#include "services/hints/bus_call.h"

#include <cstdint>
#include <cstring>
#include <utility>

#include "platform/linux/sd_bus_message.h"
#include "platform/text.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

constexpr std::uint64_t kNoTimeOut = UINT64_MAX;

Refusal unreachable(std::string why) { return {status::kUnreachable, std::move(why)}; }

Outcome<platform::Message> contentOf(sd_bus_message* reply) {
    if (const auto* error = sd_bus_message_get_error(reply))
        return unreachable(error->message ? error->message : error->name);
    std::string reason;
    auto read = platform::readDictionary(reply, reason);
    if (!read) return unreachable("its answer cannot be understood: " + reason);
    return std::move(read->message);
}

}  // namespace

BusCall::BusCall(sd_event* event, const Method& method, const platform::Message& request,
                 Answer answer)
    : _answer(std::move(answer)) {
    if (const auto reason = start(event, method, request))
        _later = callSoon(event, [this, why = *reason] { finish(unreachable(why)); });
}

BusCall::~BusCall() = default;

std::optional<std::string> BusCall::start(sd_event* event, const Method& method,
                                          const platform::Message& request) {
    sd_bus* opened = nullptr;
    if (const int code = sd_bus_open_system(&opened); code < 0)
        return platform::text("the system bus cannot be reached ({})", std::strerror(-code));
    _bus.reset(opened);
    if (const int code = sd_bus_attach_event(opened, event, SD_EVENT_PRIORITY_NORMAL); code < 0)
        return platform::text("the system bus cannot be waited for ({})", std::strerror(-code));

    sd_bus_message* made = nullptr;
    int code = sd_bus_message_new_method_call(opened, &made, method.destination.c_str(),
                                              kObjectPath, method.interface, method.member);
    const platform::SdBusMessage call(made);
    if (code < 0) return platform::text("no message can be made ({})", std::strerror(-code));
    std::string reason;
    if (!platform::appendDictionary(made, request, reason)) return reason;
    sd_bus_slot* slot = nullptr;
    code = sd_bus_call_async(opened, &slot, made, onReply, this, kNoTimeOut);
    if (code < 0) return platform::text("the message cannot be sent ({})", std::strerror(-code));
    _call.reset(slot);
    return std::nullopt;
}

int BusCall::onReply(sd_bus_message* reply, void* self, sd_bus_error*) {
    static_cast<BusCall*>(self)->finish(contentOf(reply));
    return 1;
}

// The answer may well destroy this object.
void BusCall::finish(Outcome<platform::Message> outcome) {
    std::exchange(_answer, nullptr)(std::move(outcome));
}

}  // namespace vlm::service
