#include "services/hints/forwarding_service.h"

#include <optional>
#include <utility>

#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/permission.h"
#include "services/hints/reply.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

bool isForwarded(Operation operation) {
    return operation == Operation::Login || operation == Operation::TokenInfo ||
           operation == Operation::UnlockKeybag;
}

std::optional<Refusal> refusalHere(const Caller& caller, const Outcome<Request>& request) {
    if (!request) return request.refusal();
    if (!isForwarded(request->operation))
        return Refusal{status::kNotServed,
                       platform::text("{}: the user's own hints service does not do this. Ask the "
                                      "daemon, {} on the system bus.",
                                      describe(*request), kDaemonName)};
    return refusalFor(caller, *request);
}

}  // namespace

void ForwardingService::handle(const Caller& caller, const IncomingRequest& incoming, Reply reply) {
    const auto request = readRequest(incoming);
    if (const auto refusal = refusalHere(caller, request)) {
        kLog.notice("refused for user {}: {} ({})", caller.user, refusal->text, refusal->status);
        return reply(refusalReply(*refusal));
    }
    forward(caller, incoming.message, std::move(reply));
}

void ForwardingService::forward(const Caller& caller, const platform::Message& request,
                                Reply reply) {
    const auto number = ++_last;
    auto watch = _callers.watch(caller.connection, [this, number] { _forwarded.erase(number); });
    if (!watch) return;
    auto call = _daemon.exchange(
        request, [this, number, reply = std::move(reply)](Outcome<platform::Message> outcome) {
            const auto ended = _forwarded.extract(number);
            if (!outcome) kLog.error("{} ({})", outcome.refusal().text, outcome.refusal().status);
            reply(outcome ? std::move(*outcome) : refusalReply(outcome.refusal()));
        });
    _forwarded[number] = {std::move(call), std::move(watch)};
}

}  // namespace vlm::service
