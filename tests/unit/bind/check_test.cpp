// What an operation does when no dialog was made in time.

#include "bind/bind_operation.h"
#include "lifecycle_fixture.h"

namespace vlm {
namespace {

using namespace std::chrono_literals;

class Check : public LifecycleTest {};

TEST_F(Check, AfterHalfAMinuteWithoutADialogDropsTheWatcherAndReportsThatNothingWasOffered) {
    insertBlue();
    start();

    workQueues().advanceBy(29'999ms);
    EXPECT_EQ(onMain(), Happened());
    EXPECT_FALSE(tokens.watcher.expired());
    workQueues().advanceBy(1ms);

    EXPECT_EQ(onMain(), Happened{"report 3"});
    EXPECT_EQ(reportedError, std::nullopt);
    EXPECT_EQ(operation->tokenWatcher(), nullptr);
    EXPECT_TRUE(noticed("token was removed before showing dialog"));
    EXPECT_FALSE(tokens.watcher.expired()) << "it may wait for its handler, the main queue may not";
    workQueues().runBackground();
    EXPECT_TRUE(tokens.watcher.expired());
}

TEST_F(Check, DoesNothingOnceADialogWasMade) {
    startWithBlueShown();

    workQueues().advanceBy(30s);

    EXPECT_EQ(onMain(), Happened());
    EXPECT_NE(operation->tokenWatcher(), nullptr);
    EXPECT_FALSE(noticed("token was removed before showing dialog"));
}

TEST_F(Check, DoesNothingAfterADialogThatIsClosed) {
    startWithBlueShown();
    pull(blue);
    ASSERT_EQ(onMain(), (Happened{"close", "report 2"}));

    workQueues().advanceBy(30s);

    EXPECT_EQ(onMain(), Happened());
}

TEST_F(Check, ReportsAlsoAfterACardThatOfferedNothing) {
    insertBlue();
    start();
    service.remove(blue);
    operation->setUnpairedIdentities(std::nullopt);
    tokens.watcher.lock()->insert(red);
    ASSERT_EQ(onMain(), Happened{"report 2"});

    workQueues().advanceBy(30s);

    EXPECT_EQ(onMain(), Happened{"report 3"});
    workQueues().runBackground();
}

TEST_F(Check, DoesNothingWhenTheOperationIsGone) {
    insertBlue();
    start();
    operation.reset();

    workQueues().advanceBy(30s);

    EXPECT_EQ(onMain(), Happened());
    EXPECT_FALSE(noticed("token was removed before showing dialog"));
}

TEST_F(Check, IsFollowedByNoDialogOfAHandlerThatIsOnItsWay) {
    insertBlue();
    start();
    const auto late = tokens.watcher.lock()->insertionHandler();
    workQueues().advanceBy(30s);
    ASSERT_EQ(onMain(), Happened{"report 3"});
    workQueues().runBackground();

    late(blue);

    EXPECT_EQ(onMain(), Happened());
    EXPECT_EQ(operation->dialog(), nullptr);
}

TEST_F(Check, IsFollowedByNoDialogThatIsBeingMade) {
    insertBlue();
    operation = BindOperation::initWithUserName("alice", [this](const auto& forOperation) {
        workQueues().advanceBy(30s);
        workQueues().runMain();
        auto made = std::make_shared<SilentDialog>(forOperation, events);
        dialog = made;
        return made;
    });
    start();
    workQueues().runMain();

    tokens.watcher.lock()->insert(blue);

    EXPECT_EQ(events.take(), Happened{"report 3"});
    EXPECT_FALSE(dialog.expired()) << "it goes on the main queue";
    EXPECT_EQ(onMain(), Happened());
    EXPECT_TRUE(dialog.expired());
    workQueues().runBackground();
}

}  // namespace
}  // namespace vlm
