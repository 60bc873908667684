#include "platform/linux/main_loop.h"

#include <gtest/gtest.h>
#include <poll.h>

#include <string>
#include <thread>
#include <vector>

namespace vlm::test {
namespace {

using platform::MainLoop;
using std::chrono::milliseconds;

TEST(MainLoopTest, EndsWithTheStatusThatItIsGiven) {
    MainLoop loop;
    loop.end(7);

    EXPECT_EQ(loop.run(), 7);
}

TEST(MainLoopTest, EndsAfterTheWorkThatCameBeforeTheEnd) {
    MainLoop loop;
    std::vector<std::string> done;
    loop.add([&] { done.push_back("before"); });
    loop.end(0);
    loop.add([&] { done.push_back("after"); });

    loop.run();

    EXPECT_EQ(done, std::vector<std::string>{"before"});
}

TEST(MainLoopTest, IsEndedByAnyThread) {
    MainLoop loop;
    std::thread ending([&] { loop.end(3); });

    EXPECT_EQ(loop.run(), 3);

    ending.join();
}

// Drives a loop as a toolkit's own does.
class Toolkit {
public:
    explicit Toolkit(MainLoop& loop) : _loop(loop) { ended = _loop.dispatch(); }

    bool isReadable(int patience = 0) const {
        pollfd readable{_loop.descriptor(), POLLIN, 0};
        return ::poll(&readable, 1, patience) > 0;
    }

    // Until the loop has ended.
    void run() {
        constexpr int kLongerThanAnyTest = 30'000;
        while (!ended) {
            ASSERT_TRUE(isReadable(kLongerThanAnyTest));
            ended = _loop.dispatch();
        }
    }

    std::optional<int> ended;

private:
    MainLoop& _loop;
};

TEST(MainLoopTest, IsDrivenByItsDescriptor) {
    MainLoop loop;
    std::vector<std::string> done;
    loop.add([&] { done.push_back("before it is driven"); });
    Toolkit toolkit(loop);
    EXPECT_EQ(done, std::vector<std::string>{"before it is driven"});

    loop.addAfter(milliseconds(5), [&] {
        done.push_back("later");
        std::thread([&] {
            loop.add([&] { done.push_back("from elsewhere"); });
            loop.end(5);
        }).join();
    });
    toolkit.run();

    EXPECT_EQ(done, (std::vector<std::string>{"before it is driven", "later", "from elsewhere"}));
    EXPECT_EQ(toolkit.ended, 5);
}

TEST(MainLoopTest, IsQuietWhileNothingIsDue) {
    MainLoop loop;
    loop.addAfter(std::chrono::hours(1), [] {});
    const Toolkit toolkit(loop);

    EXPECT_FALSE(toolkit.isReadable());

    loop.add([] {});
    EXPECT_TRUE(toolkit.isReadable());
    EXPECT_EQ(loop.dispatch(), std::nullopt);
    EXPECT_FALSE(toolkit.isReadable());
}

TEST(MainLoopTest, StaysEndedForWhoeverDrivesIt) {
    MainLoop loop;
    loop.end(2);
    Toolkit toolkit(loop);
    EXPECT_EQ(toolkit.ended, 2);

    EXPECT_EQ(loop.dispatch(), 2);
}

}  // namespace
}  // namespace vlm::test
