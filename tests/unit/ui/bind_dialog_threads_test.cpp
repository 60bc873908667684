// Pair between its worker and the main queue, as it is in a real process.

#include <atomic>
#include <functional>
#include <thread>
#include <utility>

#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

class BindDialogThreads : public BindDialogTest {
protected:
    void SetUp() override {
        BindDialogTest::SetUp();
        offerBlueCard();
        dialog->showWindow();
    }

    // What was clicked is done on a thread of its own, while this one does the main queue's work
    // and, at least once, what else a test wants.
    template <typename Meanwhile>
    void besideTheWorker(Meanwhile meanwhile) {
        std::atomic<bool> working = true;
        std::thread worker([&] {
            workQueues().runBackground();
            working = false;
        });
        do {
            meanwhile();
            workQueues().runMain();
        } while (working);
        worker.join();
        workQueues().runMain();
    }
};

TEST_F(BindDialogThreads, TheListIsRefreshedWhileTheWorkerPairs) {
    screen().click("okButton");

    besideTheWorker([&] { dialog->refreshIdentities(); });

    EXPECT_EQ(finishes(), Strings{"result: 0, pubKeyHash: <01>, error: (null)"});
    EXPECT_EQ(replies, std::vector{BindResult::Succeeded});
}

TEST_F(BindDialogThreads, TheAlertComesWhileTheListIsRefreshed) {
    keychain().failWith(-2022);
    screen().click("okButton");

    besideTheWorker([&] { dialog->refreshIdentities(); });

    ASSERT_EQ(screen().sheets.size(), 1U);
    screen().dismissSheet();
    workQueues().runMain();
    EXPECT_EQ(replies, std::vector{BindResult::Succeeded});
}

// The token leaves, and with it everything but the worker holds on to the dialog.
TEST_F(BindDialogThreads, TheDialogIsClosedAndLetGoWhileTheWorkerPairs) {
    const std::weak_ptr<BindDialog> gone = dialog;
    screen().click("okButton");

    besideTheWorker([&] {
        if (!dialog) return;
        dialog->close();
        dialog.reset();
    });

    EXPECT_EQ(replies, std::vector{BindResult::Succeeded});
    EXPECT_TRUE(gone.expired());
}

// A main queue that is always faster than whoever hands work in.
class EagerMainQueue final : public platform::WorkQueues {
public:
    explicit EagerMainQueue(platform::WorkQueues& others) : _others(others) {}

    std::function<void()> done;  // called after each work on the main queue

    void runOnMain(Work work) override {
        work();
        work = nullptr;
        done();
    }
    void runOnMainAfter(std::chrono::milliseconds delay, Work work) override {
        _others.runOnMainAfter(delay, std::move(work));
    }
    void runInBackground(Work work) override { _others.runInBackground(std::move(work)); }

private:
    platform::WorkQueues& _others;
};

TEST_F(BindDialogThreads, TheWorkerKeepsNothingOfTheDialogThatItGaveToTheMainQueue) {
    const std::weak_ptr<BindDialog> held = dialog;
    bool isGone = false;
    EagerMainQueue eager(workQueues());
    eager.done = [&] { isGone = held.expired(); };
    fakePlatform().workQueues = &eager;
    screen().click("okButton");
    dialog.reset();

    workQueues().runBackground();

    EXPECT_TRUE(isGone);
}

TEST_F(BindDialogThreads, TheDialogGoesOnTheMainQueueThoughTheWorkerHeldItLast) {
    const std::weak_ptr<BindDialog> held = dialog;
    screen().click("okButton");
    dialog.reset();

    std::thread([&] { workQueues().runBackground(); }).join();

    EXPECT_FALSE(held.expired());
    EXPECT_FALSE(screen().closed);
    workQueues().runMain();
    EXPECT_TRUE(held.expired());
    EXPECT_TRUE(screen().closed);
}

}  // namespace
}  // namespace vlm
