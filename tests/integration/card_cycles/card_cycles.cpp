#include "tests/integration/card_cycles/card_cycles.h"

#include <gtest/gtest.h>
#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <iostream>
#include <memory>
#include <random>
#include <vector>

#include "bind/bind_operation.h"
#include "platform/platform.h"
#include "platform/work_queues.h"
#include "tests/integration/card_cycles/card_table.h"
#include "util/bind_utils.h"

namespace vlm::test {

namespace {

constexpr int kCycles = 1000;
constexpr int kWarmUp = 100;
constexpr unsigned kSeed = 1;

// Four kilobytes that each cycle leaves behind make 3,600. Each operation's timer, which nothing
// takes back, stays for half a minute, and a busy machine frees late: both need up to half of this.
constexpr std::size_t kMostGrowth = 3 << 20;

// Sanitizers keep what was freed, to find who still uses it; they count leaks in their own way.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kCountsMemory = false;
#else
constexpr bool kCountsMemory = true;
#endif

std::size_t residentBytes() {
    ::malloc_trim(0);  // what was freed and not yet given back is no growth
    std::size_t pages = 0;
    std::ifstream("/proc/self/statm") >> pages >> pages;
    return pages * static_cast<std::size_t>(::sysconf(_SC_PAGESIZE));
}

// Starts an operation for a card unless one runs, as the agent does.
class Desk {
    // Threads that come and go would each bring and keep some memory of their own. Before the
    // first.
    const int _areMemoriesShared = ::mallopt(M_ARENA_MAX, 1);

public:
    // An ended operation watches on until it goes, and a flood of events can keep it. The agent's
    // process takes its watcher with it; in haste that is done here.
    enum class Pace { Calm, Hasty };

    explicit Desk(DialogScreen& screen, Pace pace = Pace::Calm) : _screen(screen), _pace(pace) {}

    void insert(const std::string& identity) {
        table.insert(identity);
        if (!_running) start();
    }
    void pull(const std::string& identity) { table.pull(identity); }
    void pullAll() {
        const auto inserted = table.inserted();
        for (const auto& identity : inserted) pull(identity);
    }
    void change(const std::string& identity) {
        table.inserted().contains(identity) ? pull(identity) : insert(identity);
    }

    void awaitShown() {
        _screen.runUntil([this] { return _screen.shown() == table.inserted(); });
    }
    void awaitEnd() {
        _screen.runUntil([this] { return !_running; });
    }
    void awaitShownOrEnd() {
        _screen.runUntil([this] { return !_running || _screen.shown() == table.inserted(); });
    }
    void awaitTold() {
        _screen.runUntil([this] { return table.told().size() >= table.done().size(); });
    }
    void lookAround() {
        bool isTurned = false;
        platform::current().workQueues().runOnMain([&] { isTurned = true; });
        _screen.runUntil([&] { return isTurned; });
    }
    // Often not at all, at most until another watcher has heard what was done.
    void pauseBriefly(unsigned chance) {
        if (chance % 4 == 0) lookAround();
        if (chance % 4 == 1) awaitTold();
    }

    std::size_t operations() const { return _started.size(); }

    // Takes out what is in and inserts these, until they are offered. What ends then is an
    // operation that heard only now that no card was in.
    void insertCalmly(const std::set<std::string>& identities);

    // Until all that ended is gone.
    void awaitRest();

    // Without a card all that was there for cards goes, each operation has ended once, and each
    // change was told once.
    void expectNothingLeftAfterwards();

    CardTable table;
    std::vector<BindResult> ends;

private:
    void start();
    std::ptrdiff_t operationsLeft() const;

    DialogScreen& _screen;
    const Pace _pace;
    std::shared_ptr<BindOperation> _running;
    std::vector<std::weak_ptr<BindOperation>> _started;
};

// An operation may tell its end on any thread, and again for a token that leaves late.
void Desk::start() {
    _running = BindOperation::initWithUserName(
        BindUtils::processOwnerUserName(),
        [this](const auto& operation) { return _screen.makeDialog(operation); });
    _started.push_back(_running);
    _running->startWithReply([this, started = _started.size()](BindResult result, const auto&) {
        platform::current().workQueues().runOnMain([this, started, result] {
            if (!_running || _started.size() != started) return;
            ends.push_back(result);
            if (_pace == Pace::Hasty) _running->setTokenWatcher(nullptr);
            _running.reset();
        });
    });
}

void Desk::insertCalmly(const std::set<std::string>& identities) {
    for (int tries = 0; tries < 2; ++tries) {
        pullAll();
        for (const auto& identity : identities) insert(identity);
        awaitShownOrEnd();
        if (_running) break;
    }
    EXPECT_EQ(_screen.shown(), identities);
}

std::ptrdiff_t Desk::operationsLeft() const {
    return std::ranges::count_if(_started, [](const auto& each) { return !each.expired(); });
}

// What ended is let go in the background, a watcher only when its handler is over.
void Desk::awaitRest() {
    awaitTold();
    EXPECT_TRUE(eventually([&] {
        lookAround();
        const std::ptrdiff_t wanted = _running ? 1 : 0;
        return operationsLeft() == wanted && _screen.dialogs() <= wanted;
    })) << operationsLeft()
        << " operations and " << _screen.dialogs() << " dialogs are left";
}

void Desk::expectNothingLeftAfterwards() {
    pullAll();
    awaitEnd();
    awaitRest();

    EXPECT_EQ(table.told(), table.done());
    EXPECT_EQ(ends.size(), _started.size());
    EXPECT_EQ(_screen.shown(), std::set<std::string>());
}

// A thousand times.
void repeat(Desk& desk, const std::function<void()>& cycle) {
    std::size_t before = 0;
    for (int i = 0; i < kCycles; ++i) {
        if (i == kWarmUp) {
            desk.awaitRest();
            before = residentBytes();
        }
        cycle();
        if (testing::Test::HasFailure()) return;
    }
    desk.awaitRest();
    const std::size_t after = residentBytes();
    std::cout << "resident: " << before << " bytes after " << kWarmUp << " cycles, " << after
              << " after " << kCycles << " with " << desk.operations() << " operations\n";
    if (kCountsMemory) {
        EXPECT_LE(after, before + kMostGrowth);
    }
}

}  // namespace

void insertAndPullOneCard(DialogScreen& screen) {
    Desk desk(screen);

    repeat(desk, [&] {
        desk.insert(CardTable::kAlice);
        desk.awaitShown();
        desk.pull(CardTable::kAlice);
        desk.awaitEnd();
    });

    EXPECT_EQ(desk.operations(), std::size_t{kCycles});
    EXPECT_EQ(desk.ends, std::vector(kCycles, BindResult::Canceled));
    desk.expectNothingLeftAfterwards();
}

void insertAndPullOneCardHastily(DialogScreen& screen) {
    Desk desk(screen, Desk::Pace::Hasty);
    std::mt19937 chance(kSeed);
    desk.insertCalmly({CardTable::kAlice});

    repeat(desk, [&] {
        for (int change = 0; change < 2; ++change) {
            desk.change(CardTable::kAlice);
            desk.pauseBriefly(chance());
        }
    });

    desk.insertCalmly({CardTable::kAlice});
    desk.expectNothingLeftAfterwards();
}

void insertAndPullTwoCards(DialogScreen& screen) {
    Desk desk(screen);
    std::mt19937 chance(kSeed);
    desk.insert(CardTable::kAlice);
    desk.awaitShown();

    repeat(desk, [&] {
        const auto& chosen = chance() % 2 == 0 ? CardTable::kAlice : CardTable::kBob;
        const auto& other = chosen == CardTable::kAlice ? CardTable::kBob : CardTable::kAlice;
        const bool isOnlyOne = desk.table.inserted() == std::set{chosen};
        desk.change(isOnlyOne ? other : chosen);
        desk.awaitShown();
    });

    EXPECT_EQ(desk.operations(), 1u);
    desk.expectNothingLeftAfterwards();
}

void insertAndPullTwoCardsHastily(DialogScreen& screen) {
    Desk desk(screen, Desk::Pace::Hasty);
    std::mt19937 chance(kSeed);
    desk.insertCalmly({CardTable::kAlice, CardTable::kBob});

    repeat(desk, [&] {
        desk.change(chance() % 2 == 0 ? CardTable::kAlice : CardTable::kBob);
        desk.pauseBriefly(chance());
    });

    desk.insertCalmly({CardTable::kAlice, CardTable::kBob});
    desk.expectNothingLeftAfterwards();
}

}  // namespace vlm::test
