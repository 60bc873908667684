#include "services/hints/bus_server.h"

#include <algorithm>
#include <string_view>
#include <utility>

#include "platform/linux/sd_bus_message.h"
#include "services/hints/hints_log.h"
#include "services/hints/reply.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

using platform::Message;

}  // namespace

// One request, from its coming to its answer.
class BusServer::Waiting {
public:
    Waiting(std::weak_ptr<Counts> counts, platform::UserId user, sd_bus_message* call)
        : _counts(std::move(counts)), _user(user), _call(sd_bus_message_ref(call)) {
        if (const auto all = _counts.lock()) ++(*all)[_user];
    }
    Waiting(const Waiting&) = delete;
    Waiting& operator=(const Waiting&) = delete;
    ~Waiting() { end(); }

    // The call to answer; null when it was answered, or the server is gone.
    platform::SdBusMessage end() {
        const auto all = _counts.lock();
        if (!_call || !all) return nullptr;
        const auto ofUser = all->find(_user);
        if (--ofUser->second == 0) all->erase(ofUser);
        return std::move(_call);
    }

private:
    std::weak_ptr<Counts> _counts;
    platform::UserId _user;
    platform::SdBusMessage _call;
};

BusServer::BusServer(sd_bus* bus, const char* interface, std::vector<Method> methods)
    : _bus(bus), _interface(interface), _methods(std::move(methods)) {
    _members.push_back(SD_BUS_VTABLE_START(0));
    // Anyone may call: who may have what done is decided for each request.
    for (const auto& method : _methods)
        _members.push_back(SD_BUS_METHOD_WITH_ARGS(method.name, SD_BUS_ARGS("a{sv}", request),
                                                   SD_BUS_RESULT("a{sv}", reply), onCall,
                                                   SD_BUS_VTABLE_UNPRIVILEGED));
    _members.push_back(SD_BUS_VTABLE_END);
}

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
    // Whoever changes something wants to know whether it was done. Who does not, is not held up by
    // the bus's bound on answers that are owed, and could keep this program from everybody else.
    if (sd_bus_message_get_expect_reply(call) <= 0) return;
    const auto caller = _callers.senderOf(call);
    if (!caller) return;
    if (isFull(caller->user))
        return send(call, refusalReply({status::kBusy,
                                        "Too many requests wait for the hints service already. "
                                        "Try again when some of them are answered."}));
    std::string reason;
    auto read = platform::readDictionary(call, reason);
    if (!read)
        return send(call, refusalReply({status::kBadRequest,
                                        "The request cannot be understood: " + reason}));
    IncomingRequest request{std::move(read->message), std::move(read->foreignKeys)};
    std::ranges::move(read->repeatedKeys, std::back_inserter(request.unreadableKeys));

    const auto waiting = std::make_shared<Waiting>(_counts, caller->user, call);
    exchangesFor(call).handle(*caller, request, [this, waiting](const Message& reply) {
        if (const auto answered = waiting->end()) send(answered.get(), reply);
    });
}

Exchanges& BusServer::exchangesFor(sd_bus_message* call) const {
    const std::string_view member = sd_bus_message_get_member(call);
    return std::ranges::find(_methods, member, &Method::name)->exchanges;
}

bool BusServer::isFull(platform::UserId user) const {
    std::size_t all = 0;
    for (const auto& [each, waiting] : *_counts) all += waiting;
    const auto ofUser = _counts->find(user);
    return all >= kMostWaiting ||
           (ofUser != _counts->end() && ofUser->second >= kMostWaitingOfOneUser);
}

void BusServer::send(sd_bus_message* call, const Message& content) {
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
