#include "services/hints/bus_server.h"

#include <algorithm>
#include <utility>

#include "platform/linux/sd_bus_message.h"
#include "services/hints/bus_caller.h"
#include "services/hints/hints_log.h"
#include "services/hints/reply.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

using platform::Message;

}  // namespace

BusServer::BusServer(sd_bus* bus, const char* interface, const char* method, Exchanges& exchanges)
    : _bus(bus),
      _interface(interface),
      _exchanges(exchanges),
      // Anyone may call: who may have what done is decided for each request.
      _members{{SD_BUS_VTABLE_START(0),
                SD_BUS_METHOD_WITH_ARGS(method, SD_BUS_ARGS("a{sv}", request),
                                        SD_BUS_RESULT("a{sv}", reply), onCall,
                                        SD_BUS_VTABLE_UNPRIVILEGED),
                SD_BUS_VTABLE_END}} {}

bool BusServer::start() {
    sd_bus_slot* slot = nullptr;
    if (sd_bus_add_object_vtable(_bus, &slot, kObjectPath, _interface, _members.data(), this) < 0)
        return false;
    _slot.reset(slot);
    return true;
}

int BusServer::onCall(sd_bus_message* call, void* self, sd_bus_error*) {
    static_cast<BusServer*>(self)->receive(call);
    return 1;
}

void BusServer::receive(sd_bus_message* call) {
    const auto caller = callerOf(call);
    if (!caller) return;
    if (const auto refusal = refuseMore(caller->user)) return send(call, refusalReply(*refusal));

    std::string reason;
    auto read = platform::readDictionary(call, reason);
    if (!read)
        return send(call, refusalReply({status::kBadRequest,
                                        "The request cannot be understood: " + reason}));
    IncomingRequest request{std::move(read->message), std::move(read->foreignKeys)};
    std::ranges::move(read->repeatedKeys, std::back_inserter(request.unreadableKeys));

    const auto number = ++_last;
    _waiting[number] = {platform::SdBusMessage(sd_bus_message_ref(call)), caller->user};
    _exchanges.handle(*caller, request,
                      [this, alive = std::weak_ptr(_alive), number](const Message& reply) {
                          if (alive.expired()) return;
                          const auto answered = _waiting.extract(number);
                          if (answered) send(answered.mapped().call.get(), reply);
                      });
}

std::optional<Refusal> BusServer::refuseMore(platform::UserId user) const {
    const auto ofUser = std::ranges::count_if(
        _waiting, [&](const auto& waiting) { return waiting.second.user == user; });
    if (_waiting.size() < kMostWaiting && static_cast<std::size_t>(ofUser) < kMostWaitingOfOneUser)
        return std::nullopt;
    return Refusal{status::kBusy,
                   "Too many requests wait for the hints service already. Try again when some of "
                   "them are answered."};
}

void BusServer::send(sd_bus_message* call, const Message& content) {
    if (sd_bus_message_get_expect_reply(call) <= 0) return;
    sd_bus_message* made = nullptr;
    if (sd_bus_message_new_method_return(call, &made) < 0) return;
    const platform::SdBusMessage reply(made);
    std::string reason;
    if (platform::appendDictionary(made, content, reason)) {
        sd_bus_send(_bus, made, nullptr);
    } else {
        kLog.error("a reply could not be sent: {}", reason);
        sd_bus_reply_method_errorf(call, SD_BUS_ERROR_FAILED, "%s", reason.c_str());
    }
}

}  // namespace vlm::service
