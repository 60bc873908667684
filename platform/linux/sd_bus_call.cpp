#include "platform/linux/sd_bus_call.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>

namespace vlm::platform {

namespace {

// For sd-bus to end the call itself, which it does not while it still opens the connection.
constexpr std::chrono::microseconds kGrace = std::chrono::milliseconds(500);

class Deadline {
public:
    explicit Deadline(std::chrono::microseconds patience)
        : _isAny(patience == kAnyTime), _end(Clock::now()) {
        if (!_isAny) _end += patience + kGrace;
    }

    bool isOver() const { return !_isAny && Clock::now() >= _end; }
    std::uint64_t microsecondsLeft() const {
        if (_isAny) return UINT64_MAX;
        const auto left =
            std::chrono::duration_cast<std::chrono::microseconds>(_end - Clock::now());
        return std::uint64_t(std::max(left.count(), std::int64_t{0}));
    }

private:
    using Clock = std::chrono::steady_clock;

    bool _isAny;
    Clock::time_point _end;
};

// Says that it did something: when the time is over, sd_bus_process() passes this on as its own
// result, and 0 would be taken for a reason to wait.
int keepAnswer(sd_bus_message* message, void* place, sd_bus_error*) {
    static_cast<SdBusMessage*>(place)->reset(sd_bus_message_ref(message));
    return 1;
}

}  // namespace

// The loop is here, and not sd_bus_call(), because a signal must neither end the wait nor make the
// request go out twice.
int callAndWait(sd_bus* bus, sd_bus_message* call, std::chrono::microseconds patience,
                SdBusMessage& answer) {
    const auto time = patience == kAnyTime ? UINT64_MAX : std::uint64_t(patience.count());
    sd_bus_slot* slot = nullptr;
    int result = sd_bus_call_async(bus, &slot, call, keepAnswer, &answer, time);
    const SdBusSlot outstanding(slot);
    const Deadline deadline(patience);
    while (result >= 0 && !answer) {
        result = sd_bus_process(bus, nullptr);
        if (result == 0 && deadline.isOver()) return -ETIMEDOUT;
        if (result == 0) result = sd_bus_wait(bus, deadline.microsecondsLeft());
        if (result == -EINTR) result = 0;
    }
    return answer ? 0 : result;
}

}  // namespace vlm::platform
