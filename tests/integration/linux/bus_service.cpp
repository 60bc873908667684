#include "tests/integration/linux/bus_service.h"

#include <system_error>
#include <utility>

#include "platform/linux/sd_bus_message.h"
#include "platform/linux/sd_bus_named_service_ipc.h"

namespace vlm::test {

namespace {

void check(int result, const char* what) {
    if (result < 0) throw std::system_error(-result, std::generic_category(), what);
}

}  // namespace

BusService::Handler answering(BusService::Answer answer) {
    return [answer = std::move(answer)](sd_bus_message* call) {
        std::string reason;
        const auto request = platform::readDictionary(call, reason);
        if (!request) return -EINVAL;
        sd_bus_message* message = nullptr;
        check(sd_bus_message_new_method_return(call, &message), "reply");
        const platform::SdBusMessage reply(message);
        if (!platform::appendDictionary(reply.get(), answer(request->message), reason))
            return -EINVAL;
        return sd_bus_send(nullptr, reply.get(), nullptr);
    };
}

platform::SdBus connectTo(const std::string& address) {
    sd_bus* bus = nullptr;
    check(sd_bus_new(&bus), "bus");
    platform::SdBus owner(bus);
    check(sd_bus_set_address(bus, address.c_str()), address.c_str());
    check(sd_bus_set_bus_client(bus, 1), "client");
    check(sd_bus_negotiate_fds(bus, 1), "descriptors");
    check(sd_bus_start(bus), address.c_str());
    return owner;
}

BusService::BusService(const std::string& address, const std::string& name, Answer answer)
    : BusService(address, name, answering(std::move(answer))) {}

BusService::BusService(const std::string& address, const std::string& name, Handler handler,
                       std::string resultSignature)
    : _handler(std::move(handler)),
      _resultSignature(std::move(resultSignature)),
      _methods{SD_BUS_VTABLE_START(0),
               SD_BUS_METHOD(platform::kExchangeMethod, "a{sv}", _resultSignature.c_str(),
                             &BusService::dispatch, SD_BUS_VTABLE_UNPRIVILEGED),
               SD_BUS_VTABLE_END},
      _bus(connectTo(address)) {
    sd_bus_slot* object = nullptr;
    check(sd_bus_add_object_vtable(_bus.get(), &object, platform::kExchangeObject,
                                   platform::kExchangeInterface, _methods, this),
          "object");
    _object.reset(object);
    check(sd_bus_request_name(_bus.get(), name.c_str(), 0), name.c_str());
    _thread.emplace(_bus.get());
}

int BusService::dispatch(sd_bus_message* call, void* service, sd_bus_error*) {
    const int result = static_cast<BusService*>(service)->_handler(call);
    return result < 0 ? result : 1;
}

}  // namespace vlm::test
