#include "services/hints/bus_user_keyrings.h"

#include <utility>

#include "platform/text.h"
#include "services/hints/bus_call.h"
#include "services/hints/hints_log.h"
#include "services/hints/keyring_messages.h"
#include "services/hints/late_question.h"
#include "services/hints/service_names.h"
#include "services/hints/status.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

namespace {

using namespace std::chrono_literals;
using platform::Message;
using Answer = std::function<void(Outcome<Message>)>;

Refusal noKeyring(std::string why) { return {status::kNoKeyring, std::move(why)}; }

// What a user's instance is asked. It drops it when our connection leaves the bus.
class RemoteQuestion final : public UserKeyrings::Question {
public:
    RemoteQuestion(sd_event* event, const BusCall::Method& method, const Message& request,
                   std::chrono::milliseconds patience, Answer answer)
        : _answer(std::move(answer)),
          _call(event, method, request,
                [this](Outcome<Message> reply) {
                    end(reply ? std::move(reply)
                              : noKeyring(platform::text(
                                    "the user's own hints service does not answer ({}).",
                                    reply.refusal().text)));
                }),
          _time(callAfter(event, patience, [this] {
              end(noKeyring("the user's own hints service does not answer in time."));
          })) {}

private:
    // The answer may well destroy this object.
    void end(Outcome<Message> outcome) {
        _time.reset();
        if (const auto answer = std::exchange(_answer, nullptr)) answer(std::move(outcome));
    }

    Answer _answer;
    BusCall _call;
    EventSource _time;
};

class NobodyToAsk final : public UserKeyrings::Question {
public:
    NobodyToAsk(sd_event* event, const char* why, Answer answer)
        : _later(callSoon(event, [why, answer = std::move(answer)] { answer(noKeyring(why)); })) {}

private:
    EventSource _later;
};

constexpr const char* kNoInstance =
    "the user is not logged in on a desktop here whose keyring could be reached.";
constexpr const char* kNoRoom = "the system has no room for a pipe.";
constexpr const char* kEnding = "the service was about to end after a quiet time. Try again.";

}  // namespace

std::unique_ptr<UserKeyrings::Question> BusUserKeyrings::name(
    platform::UserId user, std::function<void(Outcome<std::string>)> answer) {
    return ask(user, {"NameKeyring",
                      {},
                      _patience.machine,
                      [answer = std::move(answer)](const Outcome<Message>& reply) {
                          answer(reply ? readKeyringName(*reply) : reply.refusal());
                      }});
}

std::unique_ptr<UserKeyrings::Question> BusUserKeyrings::askPassword(
    platform::UserId user, const KeyringQuestion& question,
    std::function<void(Outcome<Secret>)> answer) {
    Answer read = [answer = std::move(answer)](const Outcome<Message>& reply) {
        answer(reply ? readKeyringPassword(*reply) : reply.refusal());
    };
    if (_isEnding) return std::make_unique<NobodyToAsk>(_event, kEnding, std::move(read));
    return ask(user, {"AskKeyringPassword", writeKeyringQuestion(question), _patience.person,
                      std::move(read)});
}

std::unique_ptr<UserKeyrings::Question> BusUserKeyrings::unlock(
    platform::UserId user, const Secret& password,
    std::function<void(std::optional<Refusal>)> answer) {
    Answer read = [answer = std::move(answer)](const Outcome<Message>& reply) {
        answer(reply ? readRefusal(*reply) : reply.refusal());
    };
    auto request = writeUnlocking(password);
    if (!request) return std::make_unique<NobodyToAsk>(_event, kNoRoom, std::move(read));
    return ask(user, {"UnlockKeyring", std::move(*request), _patience.machine, std::move(read)});
}

std::unique_ptr<UserKeyrings::Question> BusUserKeyrings::ask(platform::UserId user, Call call) {
    if (_prompters.prompterOf(user) || _prompters.timeLeftToRegister() == 0ms)
        return askNow(user, std::move(call));
    kLog.info("waiting for the hints service of user {} to register", user);
    return std::make_unique<LateQuestion<Question>>(
        _event, _prompters, user,
        [this, user, call = std::move(call)] { return askNow(user, call); });
}

std::unique_ptr<UserKeyrings::Question> BusUserKeyrings::askNow(platform::UserId user, Call call) {
    const auto prompter = _prompters.prompterOf(user);
    if (!prompter)
        return std::make_unique<NobodyToAsk>(_event, kNoInstance, std::move(call.answer));
    return std::make_unique<RemoteQuestion>(
        _event, BusCall::Method{*prompter, kPrompterInterface, call.method}, call.request,
        call.patience, std::move(call.answer));
}

}  // namespace vlm::service
