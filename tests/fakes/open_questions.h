// Questions that a test has still to answer, the oldest first. They are gone when whoever asks lets
// go of them.

#pragma once

#include <algorithm>
#include <functional>
#include <memory>
#include <utility>
#include <vector>

namespace vlm::fakes {

// `Question` is what the asking side holds.
template <typename Question, typename Answered>
class OpenQuestions {
public:
    using Answer = std::function<void(Answered)>;

    OpenQuestions() = default;
    OpenQuestions(const OpenQuestions&) = delete;
    OpenQuestions& operator=(const OpenQuestions&) = delete;

    std::unique_ptr<Question> add(Answer answer) {
        auto asked = std::make_unique<Open>(*this, std::move(answer));
        _open.push_back(asked.get());
        return asked;
    }

    void answerOldest(Answered answer) {
        auto* oldest = _open.at(0);
        _open.erase(_open.begin());
        oldest->takeAnswer()(std::move(answer));
    }

    std::size_t count() const { return _open.size(); }
    int withdrawn() const { return _withdrawn; }  // before they were answered
    int held() const { return _held; }            // answered or not

private:
    class Open final : public Question {
    public:
        Open(OpenQuestions& all, Answer answer) : _all(all), _answer(std::move(answer)) {
            ++_all._held;
        }
        Open(const Open&) = delete;
        Open& operator=(const Open&) = delete;
        ~Open() override {
            if (std::erase(_all._open, this) > 0) ++_all._withdrawn;
            --_all._held;
        }

        Answer takeAnswer() { return std::exchange(_answer, nullptr); }

    private:
        OpenQuestions& _all;
        Answer _answer;
    };

    std::vector<Open*> _open;
    int _withdrawn = 0;
    int _held = 0;
};

}  // namespace vlm::fakes
