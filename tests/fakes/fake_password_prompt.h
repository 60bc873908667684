#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "open_questions.h"
#include "services/hints/password_prompt.h"

namespace vlm::fakes {

// A person who answers when the test says so.
class FakePasswordPrompt final : public service::PasswordPrompt {
public:
    // What a person does. Each answers the oldest question that is still open.
    void enter(const std::string& password) {
        give({service::PinAnswer::Outcome::Given, service::Secret(password), {}});
    }
    void cancel() { give({service::PinAnswer::Outcome::Cancelled, {}, {}}); }
    void stayAway() { give({service::PinAnswer::Outcome::TimedOut, {}, {}}); }
    void beUnreachable(const std::string& reason) {
        give({service::PinAnswer::Outcome::Unavailable, {}, reason});
    }

    // What happened.
    std::vector<service::PasswordQuestion> questions;
    std::size_t open() const { return _open.count(); }

    std::unique_ptr<Question> ask(const service::PasswordQuestion& question,
                                  Answer answer) override {
        questions.push_back(question);
        return _open.add(std::move(answer));
    }

private:
    void give(service::PinAnswer answer) { _open.answerOldest(std::move(answer)); }

    OpenQuestions<Question, service::PinAnswer> _open;
};

}  // namespace vlm::fakes
