// What tests rely on beyond the promises of the real class.

#include "fake_work_queues.h"

#include <gtest/gtest.h>

#include <memory>

namespace vlm::fakes {
namespace {

using namespace std::chrono_literals;

TEST(FakeWorkQueues, NamesDueWorkThatWasLeft) {
    FakeWorkQueues queues;
    EXPECT_EQ(queues.leftBehind(), "");

    queues.runOnMain([] {});
    queues.runInBackground([] {});
    EXPECT_EQ(queues.leftBehind(), "1 on the main queue, 1 in the background");

    queues.runMain();
    queues.runBackground();
    EXPECT_EQ(queues.leftBehind(), "");
}

TEST(FakeWorkQueues, CountsDelayedWorkAsLeftOnlyOnceItIsDue) {
    FakeWorkQueues queues;
    queues.runOnMainAfter(30s, [] {});

    queues.advanceBy(29s);
    EXPECT_EQ(queues.leftBehind(), "");

    queues.advanceBy(1s);
    EXPECT_EQ(queues.leftBehind(), "1 on the main queue, 0 in the background");
}

TEST(FakeWorkQueues, DoesEachKindOfWorkWhenItIsSaid) {
    FakeWorkQueues queues;
    int main = 0;
    int background = 0;
    queues.runOnMain([&] { ++main; });
    queues.runInBackground([&] { ++background; });

    queues.runMain();
    EXPECT_EQ(main, 1);
    EXPECT_EQ(background, 0);

    queues.runBackground();
    EXPECT_EQ(background, 1);
}

}  // namespace
}  // namespace vlm::fakes
