#include "platform/linux/polkit_authorization.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "platform/linux/exchange_failure.h"
#include "platform/linux/polkit_verdict.h"
#include "platform/linux/sd_bus_call.h"
#include "platform/linux/sd_bus_handles.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "vlmbind");

std::string systemText(int result) { return std::generic_category().message(-result); }

ExchangeFailures failures() { return {kAuthority, ServiceScope::Machine}; }

Status failed(std::string_view what, const ExchangeFailure& failure) {
    kLog.error("{} {}", what, failure.sentence);
    return kAuthorizationFailed;
}

Status statusOf(const PolkitVerdict& verdict) {
    if (verdict.isAuthorized) return kSuccess;
    if (verdict.isDismissed) return kAuthorizationCanceled;
    return verdict.isChallenge ? kInteractionNotAllowed : kAuthorizationDenied;
}

class PolkitSession final : public AuthorizationSession {
public:
    PolkitSession(LeavingSdBus bus, std::string name, std::chrono::microseconds patience)
        : _patience(patience), _bus(std::move(bus)), _name(std::move(name)) {}

    Status request(std::string_view right, AuthorizationFlags flags) override;

private:
    int ask(const std::string& right, std::uint32_t flags, SdBusMessage& answer);

    const std::chrono::microseconds _patience;
    const LeavingSdBus _bus;
    const std::string _name;  // that of this connection
};

Status PolkitSession::request(std::string_view right, AuthorizationFlags flags) {
    const bool mayAsk = flags.interactionAllowed && flags.extendRights;
    const std::string what = "The right " + std::string(right) + " was not asked for.";
    SdBusMessage answer;
    int result = ask(std::string(right), mayAsk ? kAllowUserInteraction : 0, answer);
    if (result < 0) return failed(what, failures().busWentAway(systemText(result)));
    if (const sd_bus_error* error = sd_bus_message_get_error(answer.get()))
        return failed(what,
                      failures().errorReply(error->name, error->message ? error->message : ""));
    PolkitVerdict verdict;
    result = readPolkitVerdict(answer.get(), verdict);
    if (result < 0) return failed(what, failures().unreadableReply(systemText(result)));
    return statusOf(verdict);
}

// Without details, which are for the mechanism that acts in the end, and without the means to call
// the question off: it goes with the connection.
int PolkitSession::ask(const std::string& right, std::uint32_t flags, SdBusMessage& answer) {
    sd_bus_message* made = nullptr;
    int result = sd_bus_message_new_method_call(_bus.get(), &made, kAuthority, kAuthorityObject,
                                                kAuthorityInterface, "CheckAuthorization");
    const SdBusMessage question(made);
    if (result >= 0)
        result = sd_bus_message_append(made, "(sa{sv})sa{ss}us", "system-bus-name", 1, "name", "s",
                                       _name.c_str(), right.c_str(), 0, flags, "");
    return result < 0 ? result : callAndWait(_bus.get(), made, _patience, answer);
}

}  // namespace

CreatedAuthorizationSession PolkitAuthorization::createSession() {
    sd_bus* opened = nullptr;
    int result = sd_bus_open_system(&opened);
    LeavingSdBus bus(opened);
    const char* name = nullptr;
    // The bus gives the name when it has taken the connection in.
    if (result >= 0) result = sd_bus_get_unique_name(opened, &name);
    if (result < 0)
        return {failed("No rights can be asked for.", failures().noBus(systemText(result))),
                nullptr};
    return {kSuccess, std::make_unique<PolkitSession>(std::move(bus), name, _patience)};
}

Authorization& Platform::authorization() {
    static auto& service = *new PolkitAuthorization;
    return service;
}

}  // namespace vlm::platform
