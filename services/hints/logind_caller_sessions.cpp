#include "services/hints/logind_caller_sessions.h"

#include <systemd/sd-login.h>

#include <cstdlib>
#include <string>
#include <string_view>
#include <utility>

#include "platform/linux/sd_bus_handles.h"
#include "services/hints/hints_log.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

namespace {

struct Free {
    void operator()(char* text) const { std::free(text); }
};
using Text = std::unique_ptr<char, Free>;

// What a function of the library says; empty when it knows nothing.
template <typename Get, typename Of>
std::string textOf(Get get, Of of) {
    char* text = nullptr;
    const bool isKnown = get(of, &text) >= 0;
    const Text owner(text);
    return isKnown && text ? text : "";
}

// The id; empty when the program belongs to no session of its user.
std::string sessionOf(const Caller& caller) {
    if (caller.process == 0) return {};
    auto id = textOf(sd_pid_get_session, caller.process);
    uid_t owner = 0;
    const bool isUsersService = id.empty() && sd_pid_get_owner_uid(caller.process, &owner) >= 0;
    if (isUsersService && owner == caller.user) id = textOf(sd_uid_get_display, caller.user);
    const bool isTheirs = !id.empty() && sd_session_get_uid(id.c_str(), &owner) >= 0;
    return isTheirs && owner == caller.user ? id : "";
}

SessionState publishedState(const std::string& id) {
    if (id.empty()) return SessionState::None;
    // Whether it is remote is told of those without a seat, too; both are somewhere else.
    if (sd_session_is_remote(id.c_str()) != 0 || textOf(sd_session_get_seat, id.c_str()).empty())
        return SessionState::Away;
    return textOf(sd_session_get_state, id.c_str()) == "active" ? SessionState::Attended
                                                                : SessionState::Inactive;
}

class Known final : public CallerSessions::Question {
public:
    Known(sd_event* event, SessionState state, CallerSessions::Answer answer)
        : _later(callSoon(event, [state, answer = std::move(answer)] { answer(state); })) {}

private:
    EventSource _later;
};

// Whether the screen is locked is in no file.
class LockQuestion final : public CallerSessions::Question {
public:
    explicit LockQuestion(CallerSessions::Answer answer) : _answer(std::move(answer)) {}

    bool start(sd_bus* bus, const std::string& id) {
        char* path = nullptr;
        if (sd_bus_path_encode("/org/freedesktop/login1/session", id.c_str(), &path) < 0)
            return false;
        const Text owner(path);
        sd_bus_slot* slot = nullptr;
        const int code = sd_bus_call_method_async(
            bus, &slot, "org.freedesktop.login1", path, "org.freedesktop.DBus.Properties", "Get",
            onReply, this, "ss", "org.freedesktop.login1.Session", "LockedHint");
        _call.reset(slot);
        return code >= 0;
    }

private:
    static SessionState stateOf(sd_bus_message* reply) {
        int isLocked = 0;
        if (const auto* error = sd_bus_message_get_error(reply)) {
            kLog.error("logind does not tell whether a session is locked: {}",
                       error->message ? error->message : error->name);
            return SessionState::Unknown;
        }
        if (sd_bus_message_read(reply, "v", "b", &isLocked) < 0) return SessionState::Unknown;
        return isLocked ? SessionState::Locked : SessionState::Attended;
    }

    static int onReply(sd_bus_message* reply, void* self, sd_bus_error*) {
        // The answer may well destroy this object.
        std::exchange(static_cast<LockQuestion*>(self)->_answer, nullptr)(stateOf(reply));
        return 1;
    }

    CallerSessions::Answer _answer;
    platform::SdBusSlot _call;
};

}  // namespace

std::unique_ptr<CallerSessions::Question> LogindCallerSessions::ask(const Caller& caller,
                                                                    Answer answer) {
    const auto id = sessionOf(caller);
    auto state = publishedState(id);
    if (state == SessionState::Attended) {
        auto question = std::make_unique<LockQuestion>(answer);
        if (question->start(_bus, id)) return question;
        state = SessionState::Unknown;
    }
    return std::make_unique<Known>(sd_bus_get_event(_bus), state, std::move(answer));
}

}  // namespace vlm::service
