#include "platform/linux/thread_pool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <memory>
#include <thread>

namespace vlm::test {
namespace {

using platform::ThreadPool;
using std::chrono::hours, std::chrono::milliseconds;

constexpr std::chrono::seconds kLongerThanAnyTest{30};

// Tells when the thread that called watch() has ended.
class EndOfThread {
public:
    void watch() const { thread_local const Teller teller{_ended}; }
    bool hasCome() const {
        return _ended->get_future().wait_for(kLongerThanAnyTest) == std::future_status::ready;
    }

private:
    struct Teller {
        std::shared_ptr<std::promise<void>> ended;
        ~Teller() { ended->set_value(); }
    };

    std::shared_ptr<std::promise<void>> _ended = std::make_shared<std::promise<void>>();
};

TEST(ThreadPoolTest, RunsNoMoreAtATimeThanItMay) {
    std::atomic<int> running = 0, most = 0, left = 200;
    std::promise<void> done;
    ThreadPool pool(3, hours(1));

    for (int i = 0; i < 200; ++i)
        pool.add([&] {
            const int now = ++running;
            for (int seen = most; seen < now && !most.compare_exchange_weak(seen, now);) {
            }
            std::this_thread::yield();
            --running;
            if (--left == 0) done.set_value();
        });

    ASSERT_EQ(done.get_future().wait_for(kLongerThanAnyTest), std::future_status::ready);
    EXPECT_LE(most, 3);
}

TEST(ThreadPoolTest, EndsAThreadThatHadNoWorkForAWhile) {
    EndOfThread end;
    ThreadPool pool(1, milliseconds(1));

    pool.add([&] { end.watch(); });

    EXPECT_TRUE(end.hasCome());
}

TEST(ThreadPoolTest, StartsAgainAfterAQuietTime) {
    EndOfThread first;
    std::promise<void> again;
    ThreadPool pool(1, milliseconds(1));
    pool.add([&] { first.watch(); });
    ASSERT_TRUE(first.hasCome());

    pool.add([&] { again.set_value(); });

    EXPECT_EQ(again.get_future().wait_for(kLongerThanAnyTest), std::future_status::ready);
}

TEST(ThreadPoolTest, WaitsAtItsEndForWorkThatWasBegunAndKeepsNone) {
    std::promise<void> begun, mayGoOn;
    bool finished = false;
    const auto waiting = std::make_shared<int>();
    std::thread releasing;
    {
        ThreadPool pool(1, hours(1));
        pool.add([&] {
            begun.set_value();
            mayGoOn.get_future().wait();
            finished = true;
        });
        pool.add([waiting] {});
        begun.get_future().wait();
        releasing = std::thread([&] { mayGoOn.set_value(); });
    }
    releasing.join();

    EXPECT_TRUE(finished);
    EXPECT_EQ(waiting.use_count(), 1);
}

}  // namespace
}  // namespace vlm::test
