#pragma once

#include <memory>
#include <utility>

#include "open_questions.h"
#include "services/hints/caller_sessions.h"

namespace vlm::fakes {

// A session manager that answers when the test lets it. Everybody's session is in the same state.
class FakeCallerSessions final : public service::CallerSessions {
public:
    service::SessionState state = service::SessionState::Attended;

    // Answers everything that was asked.
    void settle() {
        while (open() > 0) _open.answerOldest(state);
    }

    std::size_t open() const { return _open.count(); }

    std::unique_ptr<Question> ask(const service::Caller&, Answer answer) override {
        return _open.add(std::move(answer));
    }

private:
    OpenQuestions<Question, service::SessionState> _open;
};

}  // namespace vlm::fakes
