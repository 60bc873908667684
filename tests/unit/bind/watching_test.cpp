// What an operation does about tokens that come and go, and when none comes.

#include "bind/bind_operation.h"
#include "lifecycle_fixture.h"

namespace vlm {
namespace {

using namespace std::chrono_literals;

class Insertion : public LifecycleTest {};

TEST_F(Insertion, ShowsTheDialogForATokenThatIsThereAlready) {
    insertBlue();
    tokens.present = {blue};

    start();

    EXPECT_EQ(events.take(), Happened{"make"}) << "made where the token was told";
    EXPECT_EQ(operation->dialog(), dialog.lock());
    EXPECT_EQ(onMain(), Happened{"show"});
    EXPECT_TRUE(debugged("token inserted: " + blue));
    EXPECT_TRUE(tokens.watcher.lock()->awaitsRemovalOf(blue));
}

TEST_F(Insertion, ShowsTheDialogForATokenThatComes) {
    insertBlue();
    start();
    ASSERT_EQ(onMain(), Happened());

    tokens.watcher.lock()->insert(blue);

    EXPECT_EQ(events.take(), Happened{"make"});
    EXPECT_EQ(onMain(), Happened{"show"});
}

TEST_F(Insertion, OfASecondCardRefreshesTheDialog) {
    startWithBlueShown();

    plugRed();

    EXPECT_EQ(onMain(), Happened{"refresh"});
    EXPECT_TRUE(offered()->contains(red));
    EXPECT_TRUE(tokens.watcher.lock()->awaitsRemovalOf(red));
}

TEST_F(Insertion, RefreshesADialogThatIsNotShownYetAfterItWasShown) {
    insertBlue();
    insertRed();
    tokens.present = {blue, red};

    start();

    EXPECT_EQ(events.take(), Happened{"make"});
    EXPECT_EQ(onMain(), (Happened{"show", "refresh"}));
}

TEST_F(Insertion, WithNothingToOfferAndNoDialogReportsCanceled) {
    insertBlue();
    start();
    service.remove(blue);
    operation->setUnpairedIdentities(std::nullopt);

    tokens.watcher.lock()->insert(red);

    EXPECT_EQ(onMain(), Happened{"report 2"});
    EXPECT_EQ(reportedError, std::nullopt);
    EXPECT_FALSE(tokens.watcher.lock()->awaitsRemovalOf(red));
}

TEST_F(Insertion, WithNothingToOfferClosesTheDialogAndReportsCanceled) {
    startWithBlueShown();
    operation->setUnpairedIdentities(Identities{});
    service.remove(blue);

    tokens.watcher.lock()->insert(red);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
}

TEST_F(Insertion, OfSomethingToOfferAfterNothingStillShowsTheDialog) {
    insertBlue();
    start();
    service.remove(blue);
    operation->setUnpairedIdentities(std::nullopt);
    tokens.watcher.lock()->insert("pkcs11:token=empty");
    ASSERT_EQ(onMain(), Happened{"report 2"});

    plugBlue();

    EXPECT_EQ(events.take(), Happened{"make"});
    EXPECT_EQ(onMain(), Happened{"show"});
}

TEST_F(Insertion, ClosedBeforeItIsShownIsNotShown) {
    insertBlue();
    start();
    service.remove(blue);
    operation->setUnpairedIdentities(std::nullopt);
    tokens.watcher.lock()->insert("pkcs11:token=empty");
    plugBlue();
    EXPECT_EQ(events.take(), Happened{"make"});

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
    EXPECT_TRUE(dialog.expired());
}

TEST_F(Insertion, DoesNothingWhenTheOperationIsGone) {
    insertBlue();
    start();
    const auto watcher = tokens.watcher.lock();
    operation.reset();
    const auto asked = askedForTokens();

    watcher->insert(blue);

    EXPECT_EQ(onMain(), Happened());
    EXPECT_EQ(askedForTokens(), asked);
    EXPECT_FALSE(debugged("token inserted: " + blue));
}

TEST_F(Insertion, AfterTheEndShowsNothingAnew) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
    ASSERT_EQ(onMain(), (Happened{"close", "report 2"}));

    plugRed();

    EXPECT_EQ(onMain(), Happened());
    EXPECT_EQ(operation->dialog(), nullptr);
}

TEST_F(Insertion, WithoutAMakerOfDialogsShowsNothingAndIsWatchedAllTheSame) {
    insertBlue();
    tokens.present = {blue};
    operation = BindOperation::initWithUserName("alice");

    start();

    EXPECT_EQ(onMain(), Happened());
    EXPECT_TRUE(tokens.watcher.lock()->awaitsRemovalOf(blue));
}

TEST_F(Insertion, AsksForTheDialogAgainThatCouldNotBeMade) {
    insertBlue();
    tokens.present = {blue};
    operation = BindOperation::initWithUserName("alice", [this](const auto&) {
        events.add("cannot make");
        return nullptr;
    });
    start();
    EXPECT_EQ(events.take(), Happened{"cannot make"});

    plugRed();

    EXPECT_EQ(events.take(), Happened{"cannot make"});
    EXPECT_EQ(onMain(), Happened());
    workQueues().advanceBy(30s);
    EXPECT_EQ(onMain(), Happened{"report 3"});
    workQueues().runBackground();
}

class Removal : public LifecycleTest {};

TEST_F(Removal, OfOneOfTwoCardsRefreshesTheDialog) {
    startWithBlueShown();
    plugRed();
    ASSERT_EQ(onMain(), Happened{"refresh"});

    pull(blue);

    EXPECT_EQ(onMain(), Happened{"refresh"});
    EXPECT_TRUE(debugged("token removed: " + blue));
    EXPECT_FALSE(debugged("all tokens were removed"));
    EXPECT_FALSE(offered()->contains(blue));
}

TEST_F(Removal, OfTheLastCardClosesTheDialogAndReportsCanceled) {
    startWithBlueShown();

    pull(blue);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
    EXPECT_EQ(reportedError, std::nullopt);
}

TEST_F(Removal, LeavingOnlyCardsThatOfferNothingClosesTheDialog) {
    startWithBlueShown();
    tokens.watcher.lock()->insert("pkcs11:token=empty");
    ASSERT_EQ(onMain(), Happened{"refresh"});

    pull(blue);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
    EXPECT_TRUE(debugged("all tokens were removed"));
}

TEST_F(Removal, WithIdentitiesLeftButNoTokenClosesTheDialog) {
    startWithBlueShown();
    plugRed();
    ASSERT_EQ(onMain(), Happened{"refresh"});
    const auto late = tokens.watcher.lock()->removalHandler(blue);
    const auto watcher = std::make_shared<ScriptedWatcher>(std::set<std::string>());
    operation->setTokenWatcher(watcher);

    late(blue);

    EXPECT_TRUE(offered()->contains(red));
    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
}

TEST_F(Removal, SaysWhatHappensInThisOrder) {
    startWithBlueShown();
    const auto before = log().lines().size();

    pull(blue);

    std::vector<std::string> said;
    for (auto i = before; i < log().lines().size(); ++i) {
        EXPECT_EQ(log().lines()[i].level, platform::LogLevel::Debug);
        said.push_back(log().lines()[i].text);
    }
    EXPECT_EQ(said, (Happened{"token removed: " + blue, "all tokens were removed"}));
    workQueues().runMain();
}

TEST_F(Removal, AfterTheEndReportsAgain) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Succeeded, blueSigning, std::nullopt);
    ASSERT_EQ(onMain(), (Happened{"close", "report 0"}));

    pull(blue);

    EXPECT_EQ(onMain(), Happened{"report 2"});
}

TEST_F(Removal, AfterTheEndThatLeavesAnOfferReportsNothing) {
    startWithBlueShown();
    plugRed();
    workQueues().runMain();
    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
    workQueues().runMain();
    events.take();

    pull(blue);

    EXPECT_EQ(onMain(), Happened());
}

TEST_F(Removal, DoesNothingWhenTheOperationIsGone) {
    startWithBlueShown();
    const auto watcher = tokens.watcher.lock();
    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
    workQueues().runMain();
    events.take();
    operation.reset();

    watcher->remove(blue);

    EXPECT_EQ(onMain(), Happened());
    EXPECT_FALSE(debugged("token removed: " + blue));
}

TEST_F(Removal, OfATokenThatWasGoneBeforeItsHandlerWasSetIsToldAtOnce) {
    insertBlue();
    start();
    const auto inserted = tokens.watcher.lock()->insertionHandler();

    inserted(blue);

    EXPECT_EQ(events.take(), Happened{"make"});
    EXPECT_EQ(onMain(), (Happened{"show", "close", "report 2"}));
}

TEST_F(Removal, MayBeTheLastThatHoldsTheOperation) {
    startWithBlueShown();
    const std::weak_ptr<BindOperation> gone = operation;
    operation.reset();
    ASSERT_FALSE(gone.expired()) << "its dialog holds it";

    pull(blue);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
    EXPECT_TRUE(gone.expired());
    EXPECT_TRUE(dialog.expired());
    EXPECT_TRUE(tokens.watcher.expired());
}

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
    EXPECT_EQ(onMain(), Happened());
    EXPECT_TRUE(dialog.expired());
    workQueues().runBackground();
}

}  // namespace
}  // namespace vlm
