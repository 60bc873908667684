#include "services/hints/card_events.h"

#include <sys/eventfd.h>

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <utility>

#include "platform/linux/background_thread.h"
#include "platform/linux/file_descriptor.h"
#include "platform/linux/growing_pause.h"
#include "services/hints/hints_log.h"
#include "services/hints/pcsc_connection.h"
#include "services/hints/reader_states.h"

namespace vlm::service {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds kPatienceAtTheEnd{1'000};
constexpr milliseconds kBetweenCancellations{20};

// Readers come in bursts: one with two slots is two, and the second may come between two waits.
constexpr milliseconds kBurst{1'000};

}  // namespace

// What the thread does. It may be held up by a pcscd that hangs, and then outlives the rest.
class CardEvents::Waiter {
public:
    int descriptor() const { return _report.get(); }
    void takeReport() const {
        eventfd_t times = 0;
        eventfd_read(_report.get(), &times);
    }

    void run();

    // Makes run() come to its end, however long that takes.
    void end();
    // Whether it has come there within the time.
    bool hasEnded(milliseconds most) {
        std::unique_lock lock(_mutex);
        return _changed.wait_for(lock, most, [this] { return _hasEnded; });
    }

private:
    bool waitOnConnection();
    void waitForCards(const PcscConnection& connection);
    void pause(milliseconds time);
    void report() const { eventfd_write(_report.get(), 1); }
    bool isEnding() {
        const std::lock_guard lock(_mutex);
        return _isEnding;
    }

    const platform::FileDescriptor _report{eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)};

    std::mutex _mutex;
    std::condition_variable _changed;
    bool _isEnding = false;
    bool _hasEnded = false;

    // Held for as long as pcscd takes to hear of a cancellation.
    std::mutex _connectionMutex;
    const PcscConnection* _connection = nullptr;
};

void CardEvents::Waiter::run() {
    platform::GrowingPause pauses;
    bool isSaid = false;
    while (!isEnding()) {
        if (waitOnConnection()) {
            pauses.reset();
            // No reader tells of its cards now.
            report();
        } else if (!std::exchange(isSaid, true)) {
            kLog.info("pcscd cannot be reached; cards are not announced until it can");
        }
        pause(pauses.next());
    }
    const std::lock_guard lock(_mutex);
    _hasEnded = true;
    _changed.notify_all();
}

// False when there is no pcscd; true when there was one.
bool CardEvents::Waiter::waitOnConnection() {
    const PcscConnection connection;
    if (!connection.isOpen()) return false;
    {
        const std::lock_guard lock(_connectionMutex);
        _connection = &connection;
    }
    report();
    waitForCards(connection);
    const std::lock_guard lock(_connectionMutex);
    _connection = nullptr;
    return true;
}

void CardEvents::Waiter::waitForCards(const PcscConnection& connection) {
    ReaderStates states;
    while (!isEnding()) {
        const auto readers = connection.readers();
        if (!readers) return;
        const bool areNew = states.setReaders(*readers);
        const auto most = areNew ? std::optional(kBurst) : std::nullopt;
        if (!connection.waitForChange(states, most)) return;
        if (states.takeCardEvent()) report();
    }
}

void CardEvents::Waiter::pause(milliseconds time) {
    std::unique_lock lock(_mutex);
    _changed.wait_for(lock, time, [this] { return _isEnding; });
}

// A cancellation is lost when the wait that it is for has not begun, so there may have to be
// several.
void CardEvents::Waiter::end() {
    {
        const std::lock_guard lock(_mutex);
        _isEnding = true;
        _changed.notify_all();
    }
    do {
        const std::lock_guard lock(_connectionMutex);
        if (_connection) _connection->cancel();
    } while (!hasEnded(kBetweenCancellations));
}

CardEvents::CardEvents(sd_event* event, std::function<void()> changed)
    : _waiter(std::make_shared<Waiter>()),
      _reported(callWhenReadable(event, _waiter->descriptor(),
                                 [waiter = _waiter, changed = std::move(changed)] {
                                     waiter->takeReport();
                                     changed();
                                 })) {
    platform::startBackgroundThread([waiter = _waiter] { waiter->run(); }).detach();
}

CardEvents::~CardEvents() {
    platform::startBackgroundThread([waiter = _waiter] { waiter->end(); }).detach();
    _waiter->hasEnded(kPatienceAtTheEnd);
}

}  // namespace vlm::service
