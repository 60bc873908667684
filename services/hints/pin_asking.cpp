#include "services/hints/pin_asking.h"

#include <utility>

#include "services/hints/prompter_messages.h"
#include "services/hints/status.h"

namespace vlm::service {

Outcome<DaemonErrand::Work> PinAsking::begin(const Caller& caller, const platform::Message& request,
                                             Reply reply) {
    auto question = readQuestion(request);
    if (!question) return Refusal{status::kBadRequest, "the question cannot be understood"};
    question->caller = caller;
    return Work(_prompt.ask(*question, [reply = std::move(reply)](const PinAnswer& answer) {
        reply(writeAnswer(answer));
    }));
}

}  // namespace vlm::service
