#include "platform/linux/exchange_failure.h"

#include <algorithm>
#include <array>
#include <utility>

#include "platform/linux/readable_text.h"
#include "platform/text.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr std::size_t kMostReasonBytes = 300;

// No status of any service.
constexpr std::int32_t kExchangeFailed = -1;

constexpr std::string_view kInstallIt = "Check that it is installed.";
constexpr std::string_view kSeeItsLog = "Look into the system log for the reason.";
constexpr std::string_view kTryAgain = "Try again; see the system log if that does not help.";

// What a bus answers in place of a service.
struct BusError {
    std::string_view name;  // after "org.freedesktop.DBus.Error."; a final dot stands for a family
    std::string_view problem;
    std::string_view remedy;
    std::optional<ConnectionEvent> event;
};

constexpr std::array kBusErrors{
    BusError{"ServiceUnknown", "is not there", kInstallIt, ConnectionEvent::Invalid},
    BusError{"NameHasNoOwner", "is not there", kInstallIt, ConnectionEvent::Invalid},
    BusError{"Spawn.", "could not be started", kSeeItsLog, ConnectionEvent::Invalid},
    BusError{"TimedOut", "did not start in time", kSeeItsLog, ConnectionEvent::Invalid},
    BusError{"NoReply", "ended before it answered", kTryAgain, ConnectionEvent::Interrupted},
    BusError{"Disconnected", "ended before it answered", kTryAgain, ConnectionEvent::Interrupted},
    BusError{"AccessDenied", "may not be called by this user",
             "An administrator can allow it in the policy of the bus.", std::nullopt},
    BusError{"LimitsExceeded", "is overloaded", "Try again later.", std::nullopt},
};

const BusError* findBusError(std::string_view name) {
    constexpr std::string_view kPrefix = "org.freedesktop.DBus.Error.";
    if (!name.starts_with(kPrefix)) return nullptr;
    name.remove_prefix(kPrefix.size());
    const auto* found = std::ranges::find_if(kBusErrors, [name](const BusError& error) {
        return error.name.ends_with('.') ? name.starts_with(error.name) : name == error.name;
    });
    return found == kBusErrors.end() ? nullptr : found;
}

}  // namespace

Message ExchangeFailure::reply() const {
    Message reply;
    encodeReplyError({std::string(VLErrorDomain), kExchangeFailed, sentence}, &reply);
    return reply;
}

ExchangeFailures::ExchangeFailures(std::string service, ServiceScope scope)
    : _service(std::move(service)), _scope(scope) {}

ExchangeFailure ExchangeFailures::notResumed() const {
    return {sentence("was not asked", "the connection is suspended", ""), std::nullopt};
}

ExchangeFailure ExchangeFailures::noBus(std::string_view reason) const {
    const std::string_view remedy =
        _scope == ServiceScope::Machine
            ? "Start the system's message bus."
            : "Log in to a desktop, or run the command under dbus-run-session.";
    return {sentence("cannot be reached, since there is no such bus", reason, remedy),
            ConnectionEvent::Invalid};
}

ExchangeFailure ExchangeFailures::busWentAway(std::string_view reason) const {
    return {sentence("cannot be reached, since the bus went away", reason, kTryAgain),
            ConnectionEvent::Interrupted};
}

ExchangeFailure ExchangeFailures::cannotBeSent(std::string_view reason) const {
    return {sentence("was not asked, since the request cannot be sent", reason, ""), std::nullopt};
}

ExchangeFailure ExchangeFailures::unreadableReply(std::string_view reason) const {
    return {sentence("gave an answer that cannot be read", reason,
                     "Check that it is of the same version as this program."),
            std::nullopt};
}

ExchangeFailure ExchangeFailures::errorReply(std::string_view name,
                                             std::string_view message) const {
    if (const BusError* error = findBusError(name))
        return {sentence(error->problem, message, error->remedy), error->event};
    return {sentence("refused the request", text("{} ({})", message, name), ""), std::nullopt};
}

std::string ExchangeFailures::sentence(std::string_view problem, std::string_view reason,
                                       std::string_view remedy) const {
    if (reason.ends_with('.')) reason.remove_suffix(1);
    return text("The service {} on the {} bus {}: {}.{}{}", readable(_service, kMostReasonBytes),
                _scope == ServiceScope::Machine ? "system" : "session", problem,
                readable(reason, kMostReasonBytes), remedy.empty() ? "" : " ", remedy);
}

}  // namespace vlm::platform
