#include "services/hints/bus_daemon_link.h"

#include <utility>

#include "platform/text.h"
#include "services/hints/bus_call.h"
#include "services/hints/service_names.h"

namespace vlm::service {

namespace {

class ForwardedCall final : public DaemonLink::Call {
public:
    ForwardedCall(sd_event* event, const platform::Message& request, DaemonLink::Answer answer)
        : _call(event, {kDaemonName, kHintsInterface, "Exchange"}, request,
                [answer = std::move(answer)](Outcome<platform::Message> outcome) {
                    answer(outcome ? std::move(outcome) : explained(outcome.refusal()));
                }) {}

private:
    static Refusal explained(const Refusal& refusal) {
        return {refusal.status,
                platform::text("The hints service {} on the system bus does not answer: {}. Check "
                               "that it is installed, and see the system log.",
                               kDaemonName, refusal.text)};
    }

    BusCall _call;
};

}  // namespace

std::unique_ptr<DaemonLink::Call> BusDaemonLink::exchange(const platform::Message& request,
                                                          Answer answer) {
    return std::make_unique<ForwardedCall>(_event, request, std::move(answer));
}

}  // namespace vlm::service
