#include "platform/linux/main_loop.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>

#include <cstdlib>
#include <ctime>
#include <utility>

#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "vlmbind");

// How much later than asked for the kernel may wake the loop; 0 would stand for a quarter second.
constexpr std::uint64_t kAccuracyMicroseconds = 1000;

}  // namespace

// As a semaphore the descriptor stays readable while works wait, and each turn of the loop does one
// of them: others that live on the loop have theirs in between.
MainLoop::MainLoop() : _waiting(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK | EFD_SEMAPHORE)) {
    sd_event* event = nullptr;
    int result = sd_event_new(&event);
    _event.reset(event);

    sd_event_source* source = nullptr;
    if (result >= 0)
        result = sd_event_add_io(event, &source, _waiting.get(), EPOLLIN, &MainLoop::onWork, this);
    _onWork.reset(std::exchange(source, nullptr));
    if (result >= 0)
        result = sd_event_add_time(event, &source, CLOCK_MONOTONIC, 0, kAccuracyMicroseconds,
                                   &MainLoop::onTime, this);
    _onTime.reset(source);
    if (result >= 0) result = sd_event_source_set_enabled(source, SD_EVENT_OFF);
    if (result >= 0) return;
    kLog.error("There is no room for the main queue's loop: error {}", -result);
    _onTime.reset();
    _onWork.reset();
    _event.reset();
}

int MainLoop::run() {
    const int status = _event ? sd_event_loop(_event.get()) : -1;
    return status < 0 ? EXIT_FAILURE : status;
}

std::optional<int> MainLoop::runWhile(const std::function<bool()>& goesOn) {
    if (!_event) return EXIT_FAILURE;
    while (!endedWith() && goesOn())
        if (sd_event_run(_event.get(), UINT64_MAX) < 0) return EXIT_FAILURE;
    return endedWith();
}

void MainLoop::end(int status) {
    add([this, status] { sd_event_exit(_event.get(), status); });
}

int MainLoop::descriptor() const { return _event ? sd_event_get_fd(_event.get()) : -1; }

// It leaves the loop prepared: only then does the descriptor tell of everything that comes.
std::optional<int> MainLoop::dispatch() {
    if (!_event) return EXIT_FAILURE;
    sd_event* event = _event.get();
    if (sd_event_get_state(event) == SD_EVENT_INITIAL) sd_event_prepare(event);
    if (sd_event_get_state(event) == SD_EVENT_ARMED) sd_event_wait(event, 0);
    do {
        if (sd_event_get_state(event) == SD_EVENT_PENDING) sd_event_dispatch(event);
    } while (sd_event_prepare(event) > 0);
    return endedWith();
}

std::optional<int> MainLoop::endedWith() const {
    int status = 0;
    if (sd_event_get_exit_code(_event.get(), &status) < 0) return std::nullopt;
    return status;
}

void MainLoop::add(Work work) {
    const std::lock_guard lock(_mutex);
    _works.push_back(std::move(work));
    ::eventfd_write(_waiting.get(), 1);
}

// The time counts from here, but only the loop's own thread may set its timer.
void MainLoop::addAfter(std::chrono::milliseconds delay, Work work) {
    const auto due = Clock::now() + delay;
    add([this, due, delayed = std::move(work)]() mutable {
        _later.emplace(due, std::move(delayed));
        awaitNextTime();
    });
}

int MainLoop::onWork(sd_event_source*, int descriptor, std::uint32_t, void* loop) {
    auto& self = *static_cast<MainLoop*>(loop);
    eventfd_t one = 0;
    if (::eventfd_read(descriptor, &one) < 0) return 0;
    Work work;
    {
        const std::lock_guard lock(self._mutex);
        work = std::move(self._works.front());
        self._works.pop_front();
    }
    work();
    return 0;
}

int MainLoop::onTime(sd_event_source*, std::uint64_t, void* loop) {
    auto& self = *static_cast<MainLoop*>(loop);
    const auto now = Clock::now();
    while (!self._later.empty() && self._later.begin()->first <= now) {
        self.add(std::move(self._later.begin()->second));
        self._later.erase(self._later.begin());
    }
    self.awaitNextTime();
    return 0;
}

void MainLoop::awaitNextTime() {
    if (_later.empty()) return;
    using std::chrono::ceil, std::chrono::microseconds;
    const auto due = ceil<microseconds>(_later.begin()->first.time_since_epoch()).count();
    sd_event_source_set_time(_onTime.get(), static_cast<std::uint64_t>(due));
    sd_event_source_set_enabled(_onTime.get(), SD_EVENT_ONESHOT);
}

}  // namespace vlm::platform
