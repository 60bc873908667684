#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "open_questions.h"
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
    std::size_t open() const { return _open.count(); }
    int held() const { return _open.held(); }

    std::unique_ptr<Question> ask(const service::PinQuestion& question, Answer answer) override {
        questions.push_back(question);
        return _open.add(std::move(answer));
    }

private:
    void give(service::PinAnswer answer) { _open.answerOldest(std::move(answer)); }

    OpenQuestions<Question, service::PinAnswer> _open;
};

}  // namespace vlm::fakes
