#include "platform/linux/session_bus_notifications.h"

#include <cerrno>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

#include "platform/linux/exchange_failure.h"
#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/send_notification.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "vlmbind");

// What the bus itself is called, and where.
constexpr const char* kBus = "org.freedesktop.DBus";
constexpr const char* kBusObject = "/org/freedesktop/DBus";
constexpr const char* kTimedOut = "org.freedesktop.DBus.Error.TimedOut";

std::string systemText(int result) { return std::generic_category().message(-result); }

std::string noBusReason(int result) {
    if (result == -ENOMEDIUM) return "neither DBUS_SESSION_BUS_ADDRESS nor XDG_RUNTIME_DIR is set";
    return systemText(result);
}

// One notification on its way. Every step answers sd-bus's result: below zero for a failure.
class Delivery {
public:
    explicit Delivery(std::chrono::microseconds patience) : _deadline(Clock::now() + patience) {}

    // What went wrong; empty when the message is handed over.
    std::string deliver(const std::string& name);

private:
    using Clock = std::chrono::steady_clock;

    int open();
    int awaitReceiver();
    int ask(const char* method, std::optional<std::uint32_t> flags, SdBusMessage& answer);
    std::string failureOf(int result) const;

    // In microseconds, and never 0: that would stand for sd-bus's own idea of a time.
    std::uint64_t timeLeft() const {
        using std::chrono::duration_cast, std::chrono::microseconds;
        const auto left = duration_cast<microseconds>(_deadline - Clock::now()).count();
        return left > 0 ? static_cast<std::uint64_t>(left) : 1;
    }

    const Clock::time_point _deadline;
    const ExchangeFailures _failures{kNotificationsService, ServiceScope::User};
    SdBus _bus;
    SdBusError _error;
};

std::string Delivery::deliver(const std::string& name) {
    int result = open();
    if (result < 0) return _failures.noBus(noBusReason(result)).sentence;
    result = sendNotification(_bus.get(), name);
    if (result < 0) return _failures.cannotBeSent(systemText(result)).sentence;
    result = awaitReceiver();
    return result < 0 ? failureOf(result) : "";
}

// A bus that is stopped takes connections all the same; it is not waited for longer than a
// receiver.
int Delivery::open() {
    sd_bus* opened = nullptr;
    int result = sd_bus_open_user(&opened);
    _bus.reset(opened);
    while (result >= 0 && sd_bus_is_ready(opened) == 0) {
        result = sd_bus_process(opened, nullptr);
        if (result == 0) result = sd_bus_wait(opened, timeLeft());
        if (result == -EINTR) result = 0;
        if (Clock::now() > _deadline) result = -ETIMEDOUT;
    }
    // What nobody takes must not be flushed.
    if (result < 0 && opened != nullptr) sd_bus_close(opened);
    return result;
}

// A bus drops what waits for a program to start when the sender leaves before that, and says
// nothing about a message without a reply. So it is asked for the start as well: it answers when
// the receiver has come, or why it cannot.
int Delivery::awaitReceiver() {
    SdBusMessage answer;
    int isThere = 0;
    int result = ask("NameHasOwner", std::nullopt, answer);
    if (result >= 0) result = sd_bus_message_read_basic(answer.get(), 'b', &isThere);
    if (result < 0 || isThere != 0) return result;
    return ask("StartServiceByName", 0, answer);
}

// Asks the bus itself about the receiver.
int Delivery::ask(const char* method, std::optional<std::uint32_t> flags, SdBusMessage& answer) {
    sd_bus_message* made = nullptr;
    int result = sd_bus_message_new_method_call(_bus.get(), &made, kBus, kBusObject, kBus, method);
    const SdBusMessage question(made);
    if (result >= 0) result = sd_bus_message_append_basic(made, 's', kNotificationsService);
    if (result >= 0 && flags) result = sd_bus_message_append_basic(made, 'u', &*flags);
    if (result < 0) return result;
    sd_bus_message* reply = nullptr;
    result = sd_bus_call(_bus.get(), made, timeLeft(), _error.get(), &reply);
    answer.reset(reply);
    return result;
}

std::string Delivery::failureOf(int result) const {
    if (result == -ETIMEDOUT) return _failures.errorReply(kTimedOut, systemText(result)).sentence;
    // An error that does not come from the bus is sd-bus's own.
    if (!_error.isSet() || std::string_view(_error.name()).starts_with("System.Error."))
        return _failures.busWentAway(systemText(result)).sentence;
    return _failures.errorReply(_error.name(), _error.message()).sentence;
}

}  // namespace

void SessionBusNotifications::post(std::string_view name) {
    const std::string failure = Delivery(_patience).deliver(std::string(name));
    if (failure.empty()) return;
    kLog.error("The notification {} was not delivered. {}", name, failure);
}

Notifications& Platform::notifications() {
    static auto& service = *new SessionBusNotifications;
    return service;
}

}  // namespace vlm::platform
