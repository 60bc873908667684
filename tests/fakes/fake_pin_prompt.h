#pragma once

#include <algorithm>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "services/hints/pin_prompt.h"

namespace vlm::fakes {

// A person who answers when the test says so.
class FakePinPrompt final : public service::PinPrompt {
public:
    // What a person does. Each answers the oldest question that is still open.
    void enter(const std::string& pin) {
        service::PinAnswer answer;
        answer.outcome = service::PinAnswer::Outcome::Given;
        answer.pin = service::Secret(pin);
        give(std::move(answer));
    }
    void cancel() { give({service::PinAnswer::Outcome::Cancelled, {}, {}}); }
    void stayAway() { give({service::PinAnswer::Outcome::TimedOut, {}, {}}); }
    void beUnreachable(const std::string& reason) {
        give({service::PinAnswer::Outcome::Unavailable, {}, reason});
    }

    // What happened.
    std::vector<service::PinQuestion> questions;
    std::size_t open() const { return _open.size(); }
    int held = 0;  // questions that the asking side has not let go of

    std::unique_ptr<Question> ask(const service::PinQuestion& question, Answer answer) override {
        questions.push_back(question);
        auto asked = std::make_unique<FakeQuestion>(*this, std::move(answer));
        _open.push_back(asked.get());
        return asked;
    }

private:
    class FakeQuestion final : public Question {
    public:
        FakeQuestion(FakePinPrompt& prompt, Answer answer)
            : _prompt(prompt), _answer(std::move(answer)) {
            ++_prompt.held;
        }
        FakeQuestion(const FakeQuestion&) = delete;
        FakeQuestion& operator=(const FakeQuestion&) = delete;
        ~FakeQuestion() override {
            std::erase(_prompt._open, this);
            --_prompt.held;
        }

        Answer takeAnswer() { return std::exchange(_answer, nullptr); }

    private:
        FakePinPrompt& _prompt;
        Answer _answer;
    };

    void give(service::PinAnswer answer) {
        auto* oldest = _open.at(0);
        _open.erase(_open.begin());
        oldest->takeAnswer()(std::move(answer));
    }

    std::vector<FakeQuestion*> _open;
};

}  // namespace vlm::fakes
