// Idleness: tells when a service has had nothing to do for long enough.
//
// The quiet time begins when the last work has ended and no proof waits for its pairing any more.
// There is one timer at most, and none during work: a quiet minute wakes nobody up.
//
// Ownership: work may outlive it. Threads: one. Blocking: never.
// Errors:    without room for a timer the service is never idle.
// In tests:  tests/unit/services/idleness_test.cpp

#pragma once

#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <utility>

namespace vlm::service {

class Idleness {
public:
    struct Parts {
        std::chrono::milliseconds enough{0};  // zero: the service is never idle
        std::function<std::chrono::milliseconds()> untilProofsEnd;
        // Calls once, after the delay, unless the returned object is gone by then.
        std::function<std::shared_ptr<void>(std::chrono::milliseconds delay,
                                            std::function<void()> call)>
            callAfter;
    };
    using Work = std::shared_ptr<const void>;

    explicit Idleness(Parts parts) : _parts(std::move(parts)) {}
    Idleness(const Idleness&) = delete;
    Idleness& operator=(const Idleness&) = delete;

    // There is work until the last copy of this is gone.
    Work begin();

    // Calls once, when it has been quiet for long enough. The time counts from now.
    void callWhenIdle(std::function<void()> call);

    // Calls once, when there is no work: now, or when what there is has ended.
    void callWhenDone(std::function<void()> call);

private:
    class Piece;

    void end();
    void rest();

    Parts _parts;
    std::size_t _pieces = 0;
    std::function<void()> _idle;
    std::function<void()> _done;
    std::shared_ptr<void> _timer;

    // Work that ends later finds this gone.
    std::shared_ptr<Idleness*> _self = std::make_shared<Idleness*>(this);
};

}  // namespace vlm::service
