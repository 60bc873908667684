#include "services/hints/forwarding_service.h"

#include <optional>
#include <utility>

#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/keyring_unlocking.h"
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

// The keyring within reach is the one of this process's user.
bool isOwn(const Request& request) {
    return request.user == platform::kNobody ||
           request.user == platform::current().processInfo().realUserId();
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
    auto request = readRequest(incoming);
    if (const auto refusal = refusalHere(caller, request)) {
        kLog.notice("refused for user {}: {} ({})", caller.user, refusal->text, refusal->status);
        return reply(refusalReply(*refusal));
    }
    if (request->operation == Operation::UnlockKeybag && isOwn(*request))
        return unlockKeyring(caller, std::move(*request), std::move(reply));
    forward(caller, incoming.message, std::move(reply));
}

void ForwardingService::forward(const Caller& caller, const platform::Message& request,
                                Reply reply) {
    const auto number = ++_last;
    auto watch = _callers.watch(caller.connection, [this, number] { _begun.erase(number); });
    if (!watch) return;
    auto call = _daemon.exchange(
        request, [this, number, reply = std::move(reply)](Outcome<platform::Message> outcome) {
            end(number, std::move(outcome), reply);
        });
    _begun[number] = {std::move(call), std::move(watch)};
}

void ForwardingService::unlockKeyring(const Caller& caller, Request request, Reply reply) {
    const auto number = ++_last;
    auto watch = _callers.watch(caller.connection, [this, number] { _begun.erase(number); });
    if (!watch) return;
    const auto done = [this, number, asked = describe(request),
                       reply = std::move(reply)](const std::optional<Refusal>& refusal) {
        if (!refusal) return end(number, numberReply(status::kSuccess), reply);
        end(number, Refusal{refusal->status, platform::text("{}: {}", asked, refusal->text)},
            reply);
    };
    auto work = std::make_shared<KeyringUnlocking>(_keyring, std::move(*request.password), done);
    _begun[number] = {std::move(work), std::move(watch)};
}

void ForwardingService::end(std::uint64_t number, Outcome<platform::Message> outcome,
                            const Reply& reply) {
    const auto ended = _begun.extract(number);
    if (!outcome) kLog.error("{} ({})", outcome.refusal().text, outcome.refusal().status);
    reply(outcome ? std::move(*outcome) : refusalReply(outcome.refusal()));
}

}  // namespace vlm::service
