// What an operation does about tokens that leave.

#include "bind/bind_operation.h"
#include "lifecycle_fixture.h"

namespace vlm {
namespace {

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

}  // namespace
}  // namespace vlm
