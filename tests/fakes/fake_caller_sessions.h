#pragma once

#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "services/hints/caller_sessions.h"

namespace vlm::fakes {

// A session manager that answers when the test lets it. Everybody's session is in the same state.
class FakeCallerSessions final : public service::CallerSessions {
public:
    service::SessionState state = service::SessionState::Attended;

    // Answers everything that was asked.
    void settle() {
        while (!_open.empty()) {
            auto* oldest = _open.front();
            _open.erase(_open.begin());
            oldest->takeAnswer()(state);
        }
    }

    std::size_t open() const { return _open.size(); }

    std::unique_ptr<Question> ask(const service::Caller&, Answer answer) override {
        auto asked = std::make_unique<FakeQuestion>(*this, std::move(answer));
        _open.push_back(asked.get());
        return asked;
    }

private:
    class FakeQuestion final : public Question {
    public:
        FakeQuestion(FakeCallerSessions& sessions, Answer answer)
            : _sessions(sessions), _answer(std::move(answer)) {}
        FakeQuestion(const FakeQuestion&) = delete;
        FakeQuestion& operator=(const FakeQuestion&) = delete;
        ~FakeQuestion() override { std::erase(_sessions._open, this); }

        Answer takeAnswer() { return std::exchange(_answer, nullptr); }

    private:
        FakeCallerSessions& _sessions;
        Answer _answer;
    };

    std::vector<FakeQuestion*> _open;
};

}  // namespace vlm::fakes
