// GrowingPause: how long to wait before the next try, twice as long each time.
//
// Threads: a value. In tests: tests/unit/platform/growing_pause_test.cpp

#pragma once

#include <algorithm>
#include <chrono>
#include <utility>

namespace vlm::platform {

class GrowingPause {
public:
    using Duration = std::chrono::milliseconds;

    // For what is not in this program's hands: it may be back at once, or never.
    static constexpr Duration kFirst = std::chrono::seconds(1);
    static constexpr Duration kLongest = std::chrono::seconds(30);

    explicit GrowingPause(Duration first = kFirst, Duration longest = kLongest)
        : _first(first), _longest(longest), _next(first) {}

    // The pause before the next try.
    Duration next() { return std::exchange(_next, std::min(2 * _next, _longest)); }

    // A try has succeeded.
    void reset() { _next = _first; }

private:
    Duration _first;
    Duration _longest;
    Duration _next;
};

}  // namespace vlm::platform
