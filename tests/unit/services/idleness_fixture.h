// An Idleness of one minute, in a time that the test moves.

#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <functional>
#include <memory>
#include <utility>

#include "services/hints/idleness.h"

namespace vlm::service {

using namespace std::chrono_literals;

class IdlenessFixture : public testing::Test {
protected:
    void start() {
        idleness.callWhenIdle([this] { ++timesIdle; });
    }

    void advanceBy(std::chrono::milliseconds time) {
        _now += time;
        const auto timer = _timer.lock();
        if (!timer || _now < timer->due) return;
        _timer.reset();
        timer->call();
    }
    void holdProofFor(std::chrono::milliseconds time) { _proofsEnd = _now + time; }
    bool isTimerArmed() const { return !_timer.expired(); }

    Idleness::Parts partsWith(std::chrono::milliseconds enough) {
        return {.enough = enough,
                .untilProofsEnd = [this] { return std::max(_proofsEnd - _now, 0ms); },
                .callAfter =
                    [this](std::chrono::milliseconds delay, std::function<void()> call) {
                        EXPECT_FALSE(isTimerArmed()) << "one timer at most";
                        auto timer = std::make_shared<Timer>(Timer{_now + delay, std::move(call)});
                        _timer = timer;
                        return timer;
                    }};
    }

private:
    struct Timer {
        std::chrono::milliseconds due;
        std::function<void()> call;
    };

    std::chrono::milliseconds _now{0};
    std::chrono::milliseconds _proofsEnd{0};
    std::weak_ptr<Timer> _timer;

protected:
    Idleness idleness{partsWith(60s)};
    int timesIdle = 0;
};

}  // namespace vlm::service
