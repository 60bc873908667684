// An operation between the watcher's thread and the main queue, as it is in a real process.

#include <gmock/gmock.h>

#include <algorithm>
#include <atomic>
#include <thread>

#include "bind/bind_operation.h"
#include "lifecycle_fixture.h"

namespace vlm {
namespace {

using namespace std::chrono_literals;

class Threads : public LifecycleTest {
protected:
    // Lets another thread watch tokens while this one works off the main queue.
    template <typename Watch>
    void besideTheMainQueue(Watch watch) {
        std::atomic<bool> watching = true;
        std::thread watcher([&] {
            watch();
            watching = false;
        });
        while (watching) workQueues().runMain();
        watcher.join();
        workQueues().runMain();
        workQueues().runBackground();
    }
};

TEST_F(Threads, TokensComeAndGoWhileTheDialogIsUsed) {
    startWithBlueShown();

    besideTheMainQueue([&] {
        for (int i = 0; i < 50; ++i) {
            plugRed();
            pull(red);
        }
    });

    const auto happened = events.take();
    EXPECT_FALSE(happened.empty());
    for (const auto& each : happened) EXPECT_EQ(each, "refresh");
    EXPECT_TRUE(offered()->contains(blue));
    EXPECT_FALSE(offered()->contains(red));
    pull(blue);
    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
}

TEST_F(Threads, TheCheckComesWhileTheFirstTokenDoes) {
    for (int round = 0; round < 50; ++round) {
        operation = makeOperation("alice");
        insertBlue();
        start();
        workQueues().advanceBy(30s);
        const auto watcher = tokens.watcher.lock();

        besideTheMainQueue([&] { watcher->insert(blue); });

        const auto happened = events.take();
        if (operation->dialog()) {
            EXPECT_EQ(happened, (Happened{"make", "show"}));
            pull(blue);
            EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
        } else {
            EXPECT_THAT(happened, testing::Contains("report 3"));
            EXPECT_THAT(happened, testing::Not(testing::Contains("show")));
            service.remove(blue);
        }
        EXPECT_TRUE(dialog.expired());
    }
}

TEST_F(Threads, TheDialogHasNoWindowWhileMoreTokensCome) {
    for (int round = 0; round < 50; ++round) {
        operation = BindOperation::initWithUserName("alice", [this](const auto& forOperation) {
            auto made = std::make_shared<SilentDialog>(forOperation, events);
            made->hasWindow = false;
            dialog = made;
            return made;
        });
        insertBlue();
        start();
        const auto watcher = tokens.watcher.lock();

        besideTheMainQueue([&] {
            watcher->insert(blue);
            watcher->insert(red);
        });

        EXPECT_EQ(events.take(), (Happened{"show", "close", "report 3"}));
        EXPECT_EQ(operation->tokenWatcher(), nullptr);
        EXPECT_TRUE(dialog.expired());
        service.remove(blue);
    }
}

TEST_F(Threads, TheDialogFinishesWhileItsTokenLeaves) {
    for (int round = 0; round < 50; ++round) {
        operation = makeOperation("alice");
        const std::weak_ptr<BindOperation> gone = operation;
        startWithBlueShown();
        operation->finishWithResult(BindResult::Succeeded, blueSigning, std::nullopt);
        operation.reset();
        const auto watcher = tokens.watcher.lock();

        besideTheMainQueue([&] {
            service.remove(blue);
            watcher->remove(blue);
        });

        const auto happened = events.take();
        EXPECT_EQ(happened.front(), "close");
        EXPECT_THAT(happened, testing::Contains("report 0"));
        EXPECT_EQ(std::ranges::count(happened, "close"), 1);
        EXPECT_TRUE(dialog.expired());
        EXPECT_TRUE(gone.expired());
    }
}

TEST_F(Threads, FinishingAndReplacingTheReplyMayMeet) {
    startWithBlueShown();

    besideTheMainQueue([&] {
        for (int i = 0; i < 100; ++i) {
            operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
            operation->setReply(reply());
        }
    });

    const auto happened = events.take();
    EXPECT_EQ(std::ranges::count(happened, "report 2"), 100);
    EXPECT_EQ(std::ranges::count(happened, "close"), 1);
}

}  // namespace
}  // namespace vlm
