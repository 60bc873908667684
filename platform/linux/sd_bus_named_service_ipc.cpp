#include "platform/linux/sd_bus_named_service_ipc.h"

#include <string>
#include <system_error>
#include <utility>

#include "platform/linux/exchange_failure.h"
#include "platform/linux/sd_bus_call.h"
#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/sd_bus_message.h"
#include "platform/platform.h"

namespace vlm::platform {

namespace {

std::string systemText(int result) { return std::generic_category().message(-result); }

class SdBusConnection final : public Connection {
public:
    SdBusConnection(std::string_view service, ServiceScope scope)
        : _service(service), _scope(scope), _failures(_service, scope) {}

    void setEventHandler(EventHandler handler) override { _handler = std::move(handler); }
    void resume() override { _resumed = true; }
    Message sendAndWait(const Message& request) override;

private:
    int openBus();
    SdBusMessage makeCall(const Message& request, std::string& reason) const;
    Message replyFrom(sd_bus_message* answer) const;
    Message failed(const ExchangeFailure& failure) const;

    const std::string _service;
    const ServiceScope _scope;
    const ExchangeFailures _failures;
    EventHandler _handler;
    bool _resumed = false;
    SdBus _bus;
};

Message SdBusConnection::sendAndWait(const Message& request) {
    if (!_resumed) return failed(_failures.notResumed());
    if (const int result = openBus(); result < 0)
        return failed(_failures.noBus(systemText(result)));
    std::string reason;
    const SdBusMessage call = makeCall(request, reason);
    if (!call) return failed(_failures.cannotBeSent(reason));
    SdBusMessage answer;
    const int result = callAndWait(_bus.get(), call.get(), kAnyTime, answer);
    // The next exchange looks for the bus anew.
    if (sd_bus_is_open(_bus.get()) <= 0) _bus.reset();
    return result < 0 ? failed(_failures.busWentAway(systemText(result))) : replyFrom(answer.get());
}

int SdBusConnection::openBus() {
    if (_bus) return 0;
    sd_bus* bus = nullptr;
    const int result =
        _scope == ServiceScope::Machine ? sd_bus_open_system(&bus) : sd_bus_open_user(&bus);
    if (result >= 0) _bus.reset(bus);
    return result;
}

SdBusMessage SdBusConnection::makeCall(const Message& request, std::string& reason) const {
    sd_bus_message* message = nullptr;
    const int result =
        sd_bus_message_new_method_call(_bus.get(), &message, _service.c_str(), kExchangeObject,
                                       kExchangeInterface, kExchangeMethod);
    SdBusMessage call(message);
    if (result < 0) {
        reason = systemText(result);
        return nullptr;
    }
    if (!appendDictionary(call.get(), request, reason)) return nullptr;
    return call;
}

Message SdBusConnection::replyFrom(sd_bus_message* answer) const {
    if (const sd_bus_error* error = sd_bus_message_get_error(answer))
        return failed(_failures.errorReply(error->name, error->message ? error->message : ""));
    std::string reason;
    auto reply = readDictionary(answer, reason);
    if (!reply) return failed(_failures.unreadableReply(reason));
    return std::move(reply->message);
}

Message SdBusConnection::failed(const ExchangeFailure& failure) const {
    if (failure.event && _handler) _handler(*failure.event);
    return failure.reply();
}

}  // namespace

std::unique_ptr<Connection> SdBusNamedServiceIpc::connect(std::string_view serviceName,
                                                          ServiceScope scope) {
    return std::make_unique<SdBusConnection>(serviceName, scope);
}

NamedServiceIpc& Platform::namedServiceIpc() {
    static auto& service = *new SdBusNamedServiceIpc;
    return service;
}

}  // namespace vlm::platform
