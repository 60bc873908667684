#include "services/hints/caller_pin_prompt.h"

#include <algorithm>
#include <utility>

#include "platform/console_sessions.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "services/hints/bus_call.h"
#include "services/hints/pinentry.h"
#include "services/hints/pinentry_program.h"
#include "services/hints/prompter_messages.h"
#include "services/hints/service_names.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

namespace {

// A question that a user's instance asks. It withdraws it when our connection leaves the bus.
class RemoteQuestion final : public PinPrompt::Question {
public:
    RemoteQuestion(sd_event* event, const std::string& prompter, const PinQuestion& question,
                   const PinPrompt::Answer& answer)
        : _call(event, {prompter, kPrompterInterface, "AskPin"}, writeQuestion(question),
                [answer](const Outcome<platform::Message>& reply) { answer(answerOf(reply)); }) {}

private:
    static PinAnswer answerOf(const Outcome<platform::Message>& reply) {
        if (reply) return readAnswer(*reply);
        return {PinAnswer::Outcome::Unavailable,
                {},
                platform::text("the user's own hints service does not answer ({})",
                               reply.refusal().text)};
    }

    BusCall _call;
};

class NobodyToAsk final : public PinPrompt::Question {
public:
    NobodyToAsk(sd_event* event, const PinPrompt::Answer& answer)
        : _later(callSoon(event, [answer] {
              answer({PinAnswer::Outcome::Unavailable,
                      {},
                      "there is no terminal and no desktop to ask on. Run the command in a "
                      "terminal, or give the PIN with the request"});
          })) {}

private:
    EventSource _later;
};

// The first one counts. Root at the console is nobody: no desktop is asked on root's behalf there.
std::optional<platform::UserId> userAtConsole() {
    const auto sessions = platform::current().consoleSessions().sessions();
    if (!sessions) return std::nullopt;
    const auto found = std::ranges::find_if(*sessions, &platform::ConsoleSession::onConsole);
    if (found == sessions->end() || found->userId == 0) return std::nullopt;
    return found->userId;
}

}  // namespace

std::unique_ptr<PinPrompt::Question> CallerPinPrompt::ask(const PinQuestion& question,
                                                          Answer answer) {
    if (auto terminal = Terminal::of(question.caller))
        return askHere(std::move(terminal), question, std::move(answer));
    if (const auto prompter = prompterFor(question.caller))
        return std::make_unique<RemoteQuestion>(_event, *prompter, question, answer);
    if (!_namedPinentry.empty()) return askHere(std::nullopt, question, std::move(answer));
    return std::make_unique<NobodyToAsk>(_event, answer);
}

std::unique_ptr<PinPrompt::Question> CallerPinPrompt::askHere(std::optional<Terminal> terminal,
                                                              const PinQuestion& question,
                                                              Answer answer) {
    return Pinentry::start(_event, pinentryFor(question.caller, _namedPinentry),
                           std::move(terminal), question, std::move(answer));
}

std::optional<std::string> CallerPinPrompt::prompterFor(const Caller& caller) const {
    if (!caller.isRoot()) return _prompters.prompterOf(caller.user);
    const auto user = userAtConsole();
    return user ? _prompters.prompterOf(*user) : std::nullopt;
}

}  // namespace vlm::service
