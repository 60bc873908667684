// What an operation does about tokens that come.

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

TEST_F(Insertion, WithoutAWindowEndsTheOperationAndDropsTheWatcher) {
    insertBlue();
    tokens.present = {blue};
    start();
    ASSERT_EQ(events.take(), Happened{"make"});
    dialog.lock()->hasWindow = false;

    EXPECT_EQ(onMain(), (Happened{"show", "close", "report 3"}));

    EXPECT_EQ(reportedError, std::nullopt);
    EXPECT_TRUE(complained("the pairing dialog cannot be shown"));
    EXPECT_TRUE(dialog.expired());
    EXPECT_EQ(operation->tokenWatcher(), nullptr);
    workQueues().runBackground();
    EXPECT_TRUE(tokens.watcher.expired());
    workQueues().advanceBy(30s);
    EXPECT_EQ(onMain(), Happened()) << "it has ended already";
}

TEST_F(Insertion, WithoutAWindowEndsAlsoWhenMoreTokensCame) {
    insertBlue();
    insertRed();
    tokens.present = {blue, red};
    start();
    ASSERT_EQ(events.take(), Happened{"make"});
    dialog.lock()->hasWindow = false;

    EXPECT_EQ(onMain(), (Happened{"show", "close", "report 3"}));
    workQueues().runBackground();
}

}  // namespace
}  // namespace vlm
