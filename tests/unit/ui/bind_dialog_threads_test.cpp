// Pair between its worker and the main queue, as it is in a real process.

#include <atomic>
#include <thread>

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
    // and what else a test wants.
    template <typename Meanwhile>
    void besideTheWorker(Meanwhile meanwhile) {
        std::atomic<bool> working = true;
        std::thread worker([&] {
            workQueues().runBackground();
            working = false;
        });
        while (working) {
            meanwhile();
            workQueues().runMain();
        }
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
    fakes::unlockKey().status = -8;
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
