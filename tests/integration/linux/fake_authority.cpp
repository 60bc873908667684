#include "tests/integration/linux/fake_authority.h"

#include <stdexcept>

#include "platform/linux/polkit_verdict.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/child.h"

namespace vlm::test {

namespace {

constexpr std::uint32_t kAllowUserInteraction = 1;

int readQuestion(sd_bus_message* call, FakeAuthority::Question& question) {
    const char* kind = nullptr;
    const char* key = nullptr;
    const char* name = nullptr;
    const char* action = nullptr;
    const char* cancellation = nullptr;
    int result = sd_bus_message_read(call, "(sa{sv})", &kind, 1, &key, "s", &name);
    if (result >= 0) result = sd_bus_message_read(call, "s", &action);
    if (result >= 0) result = sd_bus_message_read(call, "a{ss}", 0);
    if (result >= 0) result = sd_bus_message_read(call, "us", &question.flags, &cancellation);
    if (result < 0) return result;
    question.sender = sd_bus_message_get_sender(call);
    question.subjectKind = std::string(kind) + " " + key;
    question.subjectName = name;
    question.action = action;
    question.cancellation = cancellation;
    return 0;
}

int reply(sd_bus_message* call, FakeAuthority::Answer answer) {
    using Answer = FakeAuthority::Answer;
    // Polkit has details for other answers as well.
    const char* detail = answer == Answer::Dismissed
                             ? "polkit.dismissed"
                             : "polkit.retains_authorization_after_challenge";
    switch (answer) {
        case Answer::Allowed:
        case Answer::Denied:
        case Answer::Dismissed:
        case Answer::Challenge:
            return sd_bus_reply_method_return(call, "(bba{ss})", answer == Answer::Allowed,
                                              answer == Answer::Challenge, 1, detail, "true");
        case Answer::Error:
            return sd_bus_reply_method_errorf(call, "org.freedesktop.PolicyKit1.Error.Failed",
                                              "Action is not registered");
        case Answer::Unreadable:
            return sd_bus_reply_method_return(call, "b", 1);
        case Answer::Never:
            break;
    }
    return 1;
}

}  // namespace

FakeAuthority::FakeAuthority(const std::string& address)
    : _members{SD_BUS_VTABLE_START(0),
               SD_BUS_METHOD("CheckAuthorization", "(sa{sv})sa{ss}us", "(bba{ss})",
                             &FakeAuthority::onCheck, SD_BUS_VTABLE_UNPRIVILEGED),
               SD_BUS_VTABLE_END},
      _bus(connectTo(address)) {
    sd_bus_slot* object = nullptr;
    if (sd_bus_add_object_vtable(_bus.get(), &object, platform::kAuthorityObject,
                                 platform::kAuthorityInterface, _members, this) < 0)
        throw std::runtime_error("the bus does not take the object");
    _object.reset(object);
    if (sd_bus_request_name(_bus.get(), platform::kAuthority, 0) < 0)
        throw std::runtime_error("the bus does not give the name");
    _thread.emplace(_bus.get());
}

void FakeAuthority::answer(Answer answer) {
    const std::lock_guard lock(_mutex);
    _answer = answer;
}

void FakeAuthority::keep(const std::string& action) {
    const std::lock_guard lock(_mutex);
    _kept.insert(action);
}

bool FakeAuthority::isAsked() {
    std::unique_lock lock(_mutex);
    return _wasAsked.wait_for(lock, Child::kPatience, [&] { return !_questions.empty(); });
}

std::vector<FakeAuthority::Question> FakeAuthority::questions() {
    const std::lock_guard lock(_mutex);
    return _questions;
}

std::vector<std::string> FakeAuthority::asked() {
    const std::lock_guard lock(_mutex);
    return _asked;
}

int FakeAuthority::onCheck(sd_bus_message* call, void* self, sd_bus_error*) {
    return static_cast<FakeAuthority*>(self)->check(call);
}

int FakeAuthority::check(sd_bus_message* call) {
    Question question;
    const int result = readQuestion(call, question);
    return result < 0 ? result : reply(call, decide(question));
}

FakeAuthority::Answer FakeAuthority::decide(const Question& question) {
    const std::lock_guard lock(_mutex);
    _questions.push_back(question);
    _wasAsked.notify_all();
    if (_kept.contains(question.action)) return Answer::Allowed;
    if (question.flags != kAllowUserInteraction) return Answer::Challenge;
    if (_answer != Answer::Challenge) _asked.push_back(question.action);
    return _answer;
}

}  // namespace vlm::test
