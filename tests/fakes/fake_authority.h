#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "open_questions.h"
#include "services/hints/authority.h"

namespace vlm::fakes {

// An authority with a person behind it who answers when the test says so.
class FakeAuthority final : public service::Authority {
public:
    using Outcome = service::RightVerdict::Outcome;

    // What the person or the machine does. Each answers the oldest question that is still open.
    void grant() { answer({Outcome::Granted, {}, {}}); }
    void grantAndKeep(const std::string& kept) { answer({Outcome::Granted, kept, {}}); }
    void refuse(Outcome outcome, const std::string& reason = "") { answer({outcome, {}, reason}); }

    // What happened.
    std::vector<service::RightQuestion> questions;
    std::size_t open() const { return _open.count(); }
    int withdrawn() const { return _open.withdrawn(); }

    std::unique_ptr<Question> ask(const service::RightQuestion& question, Answer answer) override {
        questions.push_back(question);
        return _open.add(std::move(answer));
    }

private:
    void answer(service::RightVerdict verdict) { _open.answerOldest(std::move(verdict)); }

    OpenQuestions<Question, service::RightVerdict> _open;
};

}  // namespace vlm::fakes
