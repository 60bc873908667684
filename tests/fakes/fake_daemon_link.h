#pragma once

#include <memory>
#include <utility>
#include <vector>

#include "open_questions.h"
#include "services/hints/daemon_link.h"

namespace vlm::fakes {

// A daemon that answers when the test says so.
class FakeDaemonLink final : public service::DaemonLink {
public:
    // What the daemon does: it answers the oldest call that is still open.
    void answer(service::Outcome<platform::Message> outcome) {
        _open.answerOldest(std::move(outcome));
    }

    // What happened.
    std::vector<platform::Message> requests;
    std::size_t open() const { return _open.count(); }

    std::unique_ptr<Call> exchange(const platform::Message& request, Answer answer) override {
        requests.push_back(request);
        return _open.add(std::move(answer));
    }

private:
    OpenQuestions<Call, service::Outcome<platform::Message>> _open;
};

}  // namespace vlm::fakes
