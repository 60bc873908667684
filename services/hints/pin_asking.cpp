#include "services/hints/pin_asking.h"

#include <utility>

#include "services/hints/hints_log.h"
#include "services/hints/prompter_messages.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {

void PinAsking::handle(const Caller& caller, const IncomingRequest& request, Reply reply) {
    if (!caller.isRoot()) {
        kLog.notice("refused for user {}: asking for a PIN", caller.user);
        return reply(refusalReply({status::kNotPermitted, "only the daemon may ask for a PIN"}));
    }
    auto question = readQuestion(request.message);
    if (!question)
        return reply(refusalReply({status::kBadRequest, "the question cannot be understood"}));
    question->caller = caller;

    const auto number = ++_last;
    auto watch = _callers.watch(caller.connection, [this, number] { _asked.erase(number); });
    if (!watch) return;
    auto asked = _prompt.ask(*question, [this, number, reply = std::move(reply)](PinAnswer answer) {
        const auto ended = _asked.extract(number);
        reply(writeAnswer(answer));
    });
    _asked[number] = {std::move(asked), std::move(watch)};
}

}  // namespace vlm::service
