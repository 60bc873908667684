#include "services/hints/polkit_authority.h"

#include <cstring>
#include <string>
#include <utility>

#include "platform/linux/polkit_verdict.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/service_names.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

namespace {

using platform::kAuthority, platform::kAuthorityInterface, platform::kAuthorityObject;
constexpr std::uint64_t kNoTimeOut = UINT64_MAX;

RightVerdict failed(std::string reason) {
    return {RightVerdict::Outcome::Failed, {}, std::move(reason)};
}

RightVerdict verdictOf(sd_bus_message* reply) {
    if (const auto* error = sd_bus_message_get_error(reply))
        return failed(error->message ? error->message : error->name);
    platform::PolkitVerdict verdict;
    if (platform::readPolkitVerdict(reply, verdict) < 0)
        return failed("its answer cannot be understood");

    using Outcome = RightVerdict::Outcome;
    // Another polkit gives the same ids again.
    const char* sender = sd_bus_message_get_sender(reply);
    if (verdict.isAuthorized && !verdict.keptId.empty())
        return {
            Outcome::Granted, platform::text("{} {}", sender ? sender : "", verdict.keptId), {}};
    if (verdict.isAuthorized) return {Outcome::Granted, {}, {}};
    if (verdict.isDismissed) return {Outcome::Dismissed, {}, {}};
    return {verdict.isChallenge ? Outcome::NobodyToAsk : Outcome::Denied, {}, {}};
}

int appendDetail(sd_bus_message* call, const std::string& key, const std::string& value) {
    return sd_bus_message_append(call, "{ss}", key.c_str(), value.c_str());
}

int appendDetails(sd_bus_message* call, const RightQuestion& question) {
    int code = sd_bus_message_open_container(call, 'a', "{ss}");
    if (code >= 0) code = appendDetail(call, "polkit.message", question.sentence);
    for (const auto& [key, value] : question.details)
        if (code >= 0) code = appendDetail(call, key, value);
    return code < 0 ? code : sd_bus_message_close_container(call);
}

class PolkitQuestion final : public Authority::Question {
public:
    // The id is this question's among those of the connection.
    PolkitQuestion(sd_bus* bus, std::string id, Authority::Answer answer)
        : _bus(bus), _id(std::move(id)), _answer(std::move(answer)) {}
    PolkitQuestion(const PolkitQuestion&) = delete;
    PolkitQuestion& operator=(const PolkitQuestion&) = delete;
    ~PolkitQuestion() override {
        if (_answer && _call) withdraw();
    }

    void start(const RightQuestion& question, std::chrono::milliseconds patience) {
        const int code = send(question);
        if (code >= 0) {
            _time = callAfter(sd_bus_get_event(_bus), patience, [this] {
                withdraw();
                answer(failed("nobody answered in time"));
            });
        } else {
            fail(platform::text("the message cannot be sent ({})", std::strerror(-code)));
        }
    }

    void fail(std::string reason) {
        _time = callSoon(sd_bus_get_event(_bus),
                         [this, why = std::move(reason)] { answer(failed(why)); });
    }

private:
    int send(const RightQuestion& question) {
        sd_bus_message* made = nullptr;
        int code = sd_bus_message_new_method_call(_bus, &made, kAuthority, kAuthorityObject,
                                                  kAuthorityInterface, "CheckAuthorization");
        const platform::SdBusMessage call(made);
        if (code >= 0)
            code = sd_bus_message_append(made, "(sa{sv})s", "system-bus-name", 1, "name", "s",
                                         question.caller.connection.c_str(), kAdministratorRight);
        if (code >= 0) code = appendDetails(made, question);
        if (code >= 0)
            code = sd_bus_message_append(made, "us", platform::kAllowUserInteraction, _id.c_str());
        sd_bus_slot* slot = nullptr;
        if (code >= 0) code = sd_bus_call_async(_bus, &slot, made, onReply, this, kNoTimeOut);
        _call.reset(slot);
        return code;
    }

    // The person is not left with a question that nobody waits for.
    void withdraw() {
        if (sd_bus_call_method_async(_bus, nullptr, kAuthority, kAuthorityObject,
                                     kAuthorityInterface, "CancelCheckAuthorization", onWithdrawn,
                                     nullptr, "s", _id.c_str()) < 0)
            kLog.error("a question for the administrator's right cannot be withdrawn");
    }

    // Polkit may have answered meanwhile, and knows of no such question then.
    static int onWithdrawn(sd_bus_message*, void*, sd_bus_error*) { return 1; }

    static int onReply(sd_bus_message* reply, void* self, sd_bus_error*) {
        static_cast<PolkitQuestion*>(self)->answer(verdictOf(reply));
        return 1;
    }

    // It may well destroy this object.
    void answer(RightVerdict verdict) {
        _call.reset();
        _time.reset();
        std::exchange(_answer, nullptr)(std::move(verdict));
    }

    sd_bus* _bus;
    const std::string _id;
    Authority::Answer _answer;
    platform::SdBusSlot _call;
    EventSource _time;
};

}  // namespace

std::unique_ptr<Authority::Question> PolkitAuthority::ask(const RightQuestion& question,
                                                          Answer answer) {
    auto asked =
        std::make_unique<PolkitQuestion>(_bus, std::to_string(++_lastQuestion), std::move(answer));
    if (_isEnding)
        asked->fail("the service was about to end after a quiet time");
    else
        asked->start(question, _patience);
    return asked;
}

}  // namespace vlm::service
