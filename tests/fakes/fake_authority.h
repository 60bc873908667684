#pragma once

#include <algorithm>
#include <memory>
#include <string>
#include <utility>
#include <vector>

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
    std::size_t open() const { return _open.size(); }
    int withdrawn = 0;

    std::unique_ptr<Question> ask(const service::RightQuestion& question, Answer answer) override {
        questions.push_back(question);
        auto asked = std::make_unique<FakeQuestion>(*this, std::move(answer));
        _open.push_back(asked.get());
        return asked;
    }

private:
    class FakeQuestion final : public Question {
    public:
        FakeQuestion(FakeAuthority& authority, Answer answer)
            : _authority(authority), _answer(std::move(answer)) {}
        FakeQuestion(const FakeQuestion&) = delete;
        FakeQuestion& operator=(const FakeQuestion&) = delete;
        ~FakeQuestion() override {
            if (std::erase(_authority._open, this) > 0) ++_authority.withdrawn;
        }

        Answer takeAnswer() { return std::exchange(_answer, nullptr); }

    private:
        FakeAuthority& _authority;
        Answer _answer;
    };

    void answer(service::RightVerdict verdict) {
        auto* oldest = _open.at(0);
        _open.erase(_open.begin());
        oldest->takeAnswer()(std::move(verdict));
    }

    std::vector<FakeQuestion*> _open;
};

}  // namespace vlm::fakes
