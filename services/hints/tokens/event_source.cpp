#include "services/hints/tokens/event_source.h"

#include <sys/epoll.h>

#include <ctime>
#include <utility>

namespace vlm::service {
namespace {

using Callback = std::function<void()>;

constexpr std::uint64_t kAccuracyMicroseconds = 10'000;

int call(void* callback) {
    (*static_cast<Callback*>(callback))();
    return 0;
}

int onTime(sd_event_source*, std::uint64_t, void* callback) { return call(callback); }
int onDefer(sd_event_source*, void* callback) { return call(callback); }
int onReadable(sd_event_source*, int, std::uint32_t, void* callback) { return call(callback); }

// The loop keeps a source until its callback has returned, and the callback as long as that.
EventSource owning(int result, sd_event_source* source, std::unique_ptr<Callback> callback) {
    if (result < 0) return nullptr;
    sd_event_source_set_destroy_callback(source,
                                         [](void* owned) { delete static_cast<Callback*>(owned); });
    static_cast<void>(callback.release());
    return EventSource(source);
}

}  // namespace

EventSource callSoon(sd_event* event, Callback callback) {
    auto owned = std::make_unique<Callback>(std::move(callback));
    sd_event_source* source = nullptr;
    const int result = sd_event_add_defer(event, &source, onDefer, owned.get());
    return owning(result, source, std::move(owned));
}

EventSource callAfter(sd_event* event, std::chrono::milliseconds delay, Callback callback) {
    auto owned = std::make_unique<Callback>(std::move(callback));
    sd_event_source* source = nullptr;
    const auto microseconds = std::chrono::duration_cast<std::chrono::microseconds>(delay).count();
    const int result = sd_event_add_time_relative(event, &source, CLOCK_MONOTONIC,
                                                  static_cast<std::uint64_t>(microseconds),
                                                  kAccuracyMicroseconds, onTime, owned.get());
    return owning(result, source, std::move(owned));
}

EventSource callWhenReadable(sd_event* event, int descriptor, Callback callback) {
    auto owned = std::make_unique<Callback>(std::move(callback));
    sd_event_source* source = nullptr;
    const int result =
        sd_event_add_io(event, &source, descriptor, EPOLLIN, onReadable, owned.get());
    return owning(result, source, std::move(owned));
}

}  // namespace vlm::service
