#include "tests/integration/linux/token_service.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <array>
#include <stdexcept>
#include <utility>

#include "platform/linux/sd_bus_named_service_ipc.h"
#include "platform/linux/token_service_link.h"
#include "tests/integration/linux/child.h"

namespace vlm::test {

TokenService::TokenService(const std::string& address, std::set<std::string> tokens)
    : _members{SD_BUS_VTABLE_START(0),
               SD_BUS_METHOD("Watch", "", "as", &TokenService::onWatch, SD_BUS_VTABLE_UNPRIVILEGED),
               SD_BUS_SIGNAL("Inserted", "s", 0), SD_BUS_SIGNAL("Removed", "s", 0),
               SD_BUS_VTABLE_END},
      _requests{SD_BUS_VTABLE_START(0),
                SD_BUS_METHOD(platform::kExchangeMethod, "a{sv}", "a{sv}", &TokenService::onRequest,
                              SD_BUS_VTABLE_UNPRIVILEGED),
                SD_BUS_VTABLE_END},
      _bus(connectTo(address)),
      _stop(::eventfd(0, EFD_CLOEXEC)),
      _tokens(std::move(tokens)) {
    sd_bus_slot* object = nullptr;
    if (sd_bus_add_object_vtable(_bus.get(), &object, platform::kTokensObject,
                                 platform::kTokensInterface, _members, this) < 0)
        throw std::runtime_error("the bus does not take the object");
    _object.reset(object);
    if (sd_bus_request_name(_bus.get(), platform::kTokensService, 0) < 0)
        throw std::runtime_error("the bus does not give the name");
    _thread = std::thread([this] { run(); });
}

TokenService::~TokenService() {
    eventfd_write(_stop, 1);
    _thread.join();
    ::close(_stop);
}

void TokenService::answerRequests(const BusService::Answer& answer) {
    const std::lock_guard lock(_mutex);
    _answerRequest = answering(answer);
    sd_bus_slot* object = nullptr;
    if (sd_bus_add_object_vtable(_bus.get(), &object, platform::kExchangeObject,
                                 platform::kExchangeInterface, _requests, this) < 0)
        throw std::runtime_error("the bus does not take the requests");
    _requestsObject.reset(object);
}

void TokenService::insert(const std::string& token) {
    const std::lock_guard lock(_mutex);
    if (_tokens.insert(token).second) emit("Inserted", token);
}

void TokenService::pull(const std::string& token) {
    const std::lock_guard lock(_mutex);
    if (_tokens.erase(token) > 0) emit("Removed", token);
}

bool TokenService::isAsked(int times) {
    std::unique_lock lock(_mutex);
    return _asked.wait_for(lock, Child::kPatience, [&] { return _timesAsked >= times; });
}

void TokenService::hold() {
    const std::lock_guard lock(_mutex);
    _isHeld = true;
}

void TokenService::refuseOnce() {
    const std::lock_guard lock(_mutex);
    _refusesNext = true;
}

void TokenService::emit(const char* signal, const std::string& token) {
    sd_bus_emit_signal(_bus.get(), platform::kTokensObject, platform::kTokensInterface, signal, "s",
                       token.c_str());
    sd_bus_flush(_bus.get());
}

int TokenService::onRequest(sd_bus_message* call, void* self, sd_bus_error*) {
    const int result = static_cast<TokenService*>(self)->_answerRequest(call);
    return result < 0 ? result : 1;
}

int TokenService::onWatch(sd_bus_message* call, void* self, sd_bus_error*) {
    return static_cast<TokenService*>(self)->answer(call);
}

int TokenService::answer(sd_bus_message* call) {
    ++_timesAsked;
    _asked.notify_all();
    if (_isHeld) return 1;
    if (std::exchange(_refusesNext, false))
        return sd_bus_reply_method_errorf(call, SD_BUS_ERROR_FAILED, "the cards are tired");
    sd_bus_message* made = nullptr;
    sd_bus_message_new_method_return(call, &made);
    const platform::SdBusMessage reply(made);
    sd_bus_message_open_container(made, 'a', "s");
    for (const auto& token : _tokens) sd_bus_message_append(made, "s", token.c_str());
    sd_bus_message_close_container(made);
    return sd_bus_send(_bus.get(), made, nullptr);
}

void TokenService::run() {
    for (;;) {
        pollfd bus = {};
        {
            const std::lock_guard lock(_mutex);
            int result = 0;
            while ((result = sd_bus_process(_bus.get(), nullptr)) > 0) {
            }
            if (result < 0) return;
            bus = {sd_bus_get_fd(_bus.get()), static_cast<short>(sd_bus_get_events(_bus.get())), 0};
        }
        std::array<pollfd, 2> waiting{{{_stop, POLLIN, 0}, bus}};
        if (::poll(waiting.data(), waiting.size(), -1) > 0 && waiting[0].revents != 0) return;
    }
}

}  // namespace vlm::test
