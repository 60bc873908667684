#include <latch>

#include "fake_work_queues.h"
#include "platform/linux/event_loop_work_queues.h"
#include "tests/contracts/work_queues_contract.h"

namespace vlm::test {

namespace {

using std::chrono::milliseconds;

class FakeWorkQueuesBackend : public contracts::FakeBackend<fakes::FakeWorkQueues> {
public:
    void end() { _ended = true; }

    void run() {
        while (!_ended) {
            get().runBackground();
            if (!get().runNextOnMain() && !get().advanceToNext()) break;
        }
        EXPECT_TRUE(_ended) << "nothing is left to do, and nobody ended it";
    }

private:
    bool _ended = false;
};

class EventLoopBackend {
public:
    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::EventLoopWorkQueues& get() { return _queues; }
    void end() { _queues.mainLoop().end(0); }
    void run() { EXPECT_EQ(_queues.mainLoop().run(), 0); }

private:
    platform::EventLoopWorkQueues _queues;
};

class EventLoopWorkQueuesTest : public contracts::ContractTest<EventLoopBackend> {
protected:
    platform::EventLoopWorkQueues& queues() { return backend().get(); }
};

TEST_F(EventLoopWorkQueuesTest, DoesNoDelayedWorkBeforeItsTime) {
    const auto begin = std::chrono::steady_clock::now();
    auto done = begin;
    queues().runOnMainAfter(milliseconds(30), [&] {
        done = std::chrono::steady_clock::now();
        backend().end();
    });

    backend().run();

    EXPECT_GE(done - begin, milliseconds(30));
}

TEST_F(EventLoopWorkQueuesTest, DoesMainWorkOnTheThreadOfTheLoopAndOtherWorkOnOthers) {
    std::thread::id main, background;
    queues().runInBackground([&] {
        background = std::this_thread::get_id();
        queues().runOnMain([&] {
            main = std::this_thread::get_id();
            backend().end();
        });
    });

    backend().run();

    EXPECT_EQ(main, std::this_thread::get_id());
    EXPECT_NE(background, main);
}

// Each work waits for the others, so this ends only if they run side by side.
TEST_F(EventLoopWorkQueuesTest, DoesBackgroundWorkSideBySide) {
    constexpr auto kWorks = platform::EventLoopWorkQueues::kMostThreads;
    std::latch allThere(kWorks);
    unsigned passed = 0;
    for (unsigned i = 0; i < kWorks; ++i)
        queues().runInBackground([&] {
            allThere.arrive_and_wait();
            queues().runOnMain([&] {
                if (++passed == kWorks) backend().end();
            });
        });

    backend().run();

    EXPECT_EQ(passed, kWorks);
}

TEST_F(EventLoopWorkQueuesTest, GoesAwayWithWorkThatWasNotDone) {
    const auto onMain = std::make_shared<int>();
    const auto delayed = std::make_shared<int>();
    {
        platform::EventLoopWorkQueues queues;
        queues.runOnMain([onMain] {});
        queues.runOnMainAfter(std::chrono::hours(1), [delayed] {});
    }

    EXPECT_EQ(onMain.use_count(), 1);
    EXPECT_EQ(delayed.use_count(), 1);
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, WorkQueuesContract, test::FakeWorkQueuesBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(EventLoop, WorkQueuesContract, test::EventLoopBackend);
}  // namespace vlm::contracts
