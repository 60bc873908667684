#include "services/hints/daemon_errand.h"

#include <utility>

#include "services/hints/hints_log.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {

void DaemonErrand::handle(const Caller& caller, const IncomingRequest& request, Reply reply) {
    if (!caller.isRoot()) {
        kLog.notice("refused for user {}: what only the daemon may ask for", caller.user);
        return reply(refusalReply({status::kNotPermitted, "only the daemon may ask for this"}));
    }
    const auto number = ++_last;
    auto watch = _callers.watch(caller.connection, [this, number] { _begun.erase(number); });
    if (!watch) return;
    auto work = begin(caller, request.message, [this, number, reply](platform::Message answer) {
        const auto ended = _begun.extract(number);
        reply(std::move(answer));
    });
    if (!work) return reply(refusalReply(work.refusal()));
    _begun[number] = {std::move(*work), std::move(watch)};
}

}  // namespace vlm::service
