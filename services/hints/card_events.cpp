#include "services/hints/card_events.h"

#include <poll.h>
#include <sys/eventfd.h>

#include <array>
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
#include "services/hints/pcscd_socket.h"
#include "services/hints/reader_states.h"

namespace vlm::service {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds kPatienceAtTheEnd{1'000};
constexpr milliseconds kBetweenCancellations{20};

// Readers come in bursts: one with two slots is two, and the second may come between two waits.
constexpr milliseconds kBurst{1'000};

// With the pauses between them: as long as a pcscd that starts may take, and longer than systemd
// tries to start one that cannot.
constexpr int kMostTries = 5;

}  // namespace

// What the thread does. It may be held up by a pcscd that hangs, and then outlives the rest.
class CardEvents::Waiter {
public:
    int descriptor() const { return _report.get(); }
    CardEvent takeReport() {
        eventfd_t times = 0;
        eventfd_read(_report.get(), &times);
        const std::lock_guard lock(_mutex);
        return std::exchange(_event, CardEvent::CardMoved);
    }

    void run();
    void endPause() const { eventfd_write(_endOfPause.get(), 1); }

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
    bool pause(const PcscdSocket& socket, std::optional<milliseconds> most) const;
    void report(CardEvent event);
    bool isEnding() {
        const std::lock_guard lock(_mutex);
        return _isEnding;
    }

    const platform::FileDescriptor _report{eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)};
    const platform::FileDescriptor _endOfPause{eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)};

    std::mutex _mutex;
    std::condition_variable _changed;
    CardEvent _event = CardEvent::CardMoved;  // that is reported
    bool _isEnding = false;
    bool _hasEnded = false;

    // Held for as long as pcscd takes to hear of a cancellation.
    std::mutex _connectionMutex;
    const PcscConnection* _connection = nullptr;
};

void CardEvents::Waiter::run() {
    PcscdSocket socket;
    platform::GrowingPause pauses;
    int tries = 0;
    bool isSaid = false;
    while (!isEnding()) {
        // Before the try, so that no socket comes in between.
        socket.watch();
        if (waitOnConnection()) {
            tries = 0;
            pauses.reset();
        } else if (!std::exchange(isSaid, true)) {
            kLog.info("pcscd cannot be reached; cards are not announced until it can");
        }
        const bool isLast = ++tries >= kMostTries && socket.isWatched();
        const auto most = isLast ? std::nullopt : std::optional(pauses.next());
        if (pause(socket, most)) {
            tries = 0;
            pauses.reset();
        }
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
    report(CardEvent::PcscdCame);
    waitForCards(connection);
    report(CardEvent::PcscdWent);
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
        const bool isPulled = states.takeCardPulled();
        if (states.takeCardEvent()) report(isPulled ? CardEvent::CardPulled : CardEvent::CardMoved);
    }
}

// Whether it ended before its time.
bool CardEvents::Waiter::pause(const PcscdSocket& socket, std::optional<milliseconds> most) const {
    std::array<pollfd, 2> ends{{{_endOfPause.get(), POLLIN, 0}, {socket.descriptor(), POLLIN, 0}}};
    const int ended = poll(ends.data(), ends.size(), most ? static_cast<int>(most->count()) : -1);
    eventfd_t times = 0;
    eventfd_read(_endOfPause.get(), &times);
    return ended > 0;
}

// Of what is not yet taken, the latest about pcscd counts, else a card that was pulled.
void CardEvents::Waiter::report(CardEvent event) {
    const std::lock_guard lock(_mutex);
    if (event >= CardEvent::PcscdCame || event > _event) _event = event;
    eventfd_write(_report.get(), 1);
}

// A cancellation is lost when the wait that it is for has not begun, so there may have to be
// several.
void CardEvents::Waiter::end() {
    {
        const std::lock_guard lock(_mutex);
        _isEnding = true;
    }
    endPause();
    do {
        const std::lock_guard lock(_connectionMutex);
        if (_connection) _connection->cancel();
    } while (!hasEnded(kBetweenCancellations));
}

CardEvents::CardEvents(sd_event* event, std::function<void(CardEvent)> happened)
    : _waiter(std::make_shared<Waiter>()),
      _reported(callWhenReadable(
          event, _waiter->descriptor(),
          [waiter = _waiter, happened = std::move(happened)] { happened(waiter->takeReport()); })) {
    platform::startBackgroundThread([waiter = _waiter] { waiter->run(); }).detach();
}

void CardEvents::tryPcscdAgain() { _waiter->endPause(); }

CardEvents::~CardEvents() {
    platform::startBackgroundThread([waiter = _waiter] { waiter->end(); }).detach();
    _waiter->hasEnded(kPatienceAtTheEnd);
}

}  // namespace vlm::service
