#pragma once

#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "services/hints/daemon_link.h"

namespace vlm::fakes {

// A daemon that answers when the test says so.
class FakeDaemonLink final : public service::DaemonLink {
public:
    // What the daemon does: it answers the oldest call that is still open.
    void answer(service::Outcome<platform::Message> outcome) {
        auto* oldest = _open.at(0);
        _open.erase(_open.begin());
        oldest->takeAnswer()(std::move(outcome));
    }

    // What happened.
    std::vector<platform::Message> requests;
    std::size_t open() const { return _open.size(); }

    std::unique_ptr<Call> exchange(const platform::Message& request, Answer answer) override {
        requests.push_back(request);
        auto call = std::make_unique<FakeCall>(*this, std::move(answer));
        _open.push_back(call.get());
        return call;
    }

private:
    class FakeCall final : public Call {
    public:
        FakeCall(FakeDaemonLink& daemon, Answer answer)
            : _daemon(daemon), _answer(std::move(answer)) {}
        FakeCall(const FakeCall&) = delete;
        FakeCall& operator=(const FakeCall&) = delete;
        ~FakeCall() override { std::erase(_daemon._open, this); }

        Answer takeAnswer() { return std::exchange(_answer, nullptr); }

    private:
        FakeDaemonLink& _daemon;
        Answer _answer;
    };

    std::vector<FakeCall*> _open;
};

}  // namespace vlm::fakes
