// FakeAuthority: an authority on a bus that answers as polkit does, with a person who decides as
// the test says. It keeps the questions that it was asked.
//
// Threads: the test's; questions are answered on a thread of its own.
// Errors:  the constructor throws when the authority cannot be put on the bus.

#pragma once

#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "platform/linux/sd_bus_handles.h"
#include "tests/integration/linux/bus_thread.h"

namespace vlm::test {

class FakeAuthority {
public:
    enum class Answer {
        Allowed,
        Denied,
        Dismissed,
        Challenge,   // nobody can be asked
        Error,       // as for an action that is not installed
        Unreadable,  // true, and nothing else
        Never,
    };

    struct Question {
        std::string sender;
        std::string subjectKind;
        std::string subjectName;
        std::string action;
        std::uint32_t flags = 0;
        std::string cancellation;
    };

    explicit FakeAuthority(const std::string& address);
    // The authority leaves the bus with the object, with questions unanswered if there are any.
    FakeAuthority(const FakeAuthority&) = delete;
    FakeAuthority& operator=(const FakeAuthority&) = delete;

    // To whoever may be asked from now on.
    void answer(Answer answer);
    void keep(const std::string& action);

    // Whether a question comes before the patience of a test is over.
    bool isAsked();

    std::vector<Question> questions();
    // The actions that a person was asked about.
    std::vector<std::string> asked();

private:
    static int onCheck(sd_bus_message* call, void* self, sd_bus_error* error);
    int check(sd_bus_message* call);
    Answer decide(const Question& question);

    const sd_bus_vtable _members[3];
    platform::SdBus _bus;
    platform::SdBusSlot _object;

    std::mutex _mutex;  // of all that follows
    std::condition_variable _wasAsked;
    Answer _answer = Answer::Allowed;
    std::set<std::string> _kept;
    std::vector<Question> _questions;
    std::vector<std::string> _asked;

    std::optional<BusThread> _thread;
};

}  // namespace vlm::test
