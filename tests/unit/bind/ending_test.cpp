// How an operation ends: the alert, the report, and what is let go.

#include "bind/bind_operation.h"
#include "lifecycle_fixture.h"

namespace vlm {
namespace {

using platform::LogLevel;

class Finish : public LifecycleTest {
protected:
    void SetUp() override {
        LifecycleTest::SetUp();
        auto& texts = fakePlatform().fakeLocalization;
        texts.translate("OK", "Fine");
        texts.translate("PAIRING_FAILED", "It failed.");
        texts.translate("PAIRING_ERROR", "Because: {}");
    }

    const Error refused{"VLErrorDomain", -8, "The card is {} taken."};
    const Error silent{"VLErrorDomain", -8, std::nullopt};
};

TEST_F(Finish, LogsAndReturnsBeforeAnythingIsDone) {
    startWithBlueShown();

    operation->finishWithResult(BindResult::Failed, blueSigning, refused);

    EXPECT_TRUE(
        debugged("finishWithResult: result: 1, pubKeyHash: <B1>, error: VLErrorDomain "
                 "error -8: The card is {} taken."));
    EXPECT_EQ(onMain(), Happened{"alert"});
}

TEST_F(Finish, LogsWhatIsAbsent) {
    startWithBlueShown();

    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);

    EXPECT_TRUE(debugged("finishWithResult: result: 2, pubKeyHash: (null), error: (null)"));
    workQueues().runMain();
}

TEST_F(Finish, OtherThanFailedClosesTheDialogAndReportsAtOnce) {
    for (const auto result :
         {BindResult::Succeeded, BindResult::Canceled, BindResult::NotOffered}) {
        operation = makeOperation("alice");
        startWithBlueShown();

        operation->finishWithResult(result, std::nullopt, std::nullopt);

        EXPECT_EQ(onMain(),
                  (Happened{"close", "report " + std::to_string(static_cast<int>(result))}));
        EXPECT_EQ(reportedError, std::nullopt);
        service.remove(blue);
    }
}

TEST_F(Finish, PassesAnErrorThroughAlsoWithoutAFailure) {
    startWithBlueShown();

    operation->finishWithResult(BindResult::Succeeded, blueSigning, refused);

    EXPECT_EQ(onMain(), (Happened{"close", "report 0"}));
    EXPECT_EQ(reportedError, refused);
}

TEST_F(Finish, FailedShowsAnAlertAndReportsWhenItWasDismissed) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Failed, blueSigning, refused);
    ASSERT_EQ(onMain(), Happened{"alert"});
    const auto shown = dialog.lock();
    ASSERT_TRUE(shown->alert);
    EXPECT_EQ(shown->alert->style, platform::AlertStyle::Critical);
    EXPECT_EQ(shown->alert->message, "It failed.");
    EXPECT_EQ(shown->alert->information, "Because: The card is {} taken.");
    EXPECT_EQ(shown->alert->button, "Fine");

    shown->dismiss();

    EXPECT_EQ(events.take(), (Happened{"close", "report 1"}));
    EXPECT_EQ(reportedError, refused);
    workQueues().runMain();
}

TEST_F(Finish, FailedWithoutADescriptionShowsTheTitleOnly) {
    startWithBlueShown();
    for (const std::optional<Error>& error : {std::optional(silent), std::optional<Error>()}) {
        operation->finishWithResult(BindResult::Failed, blueSigning, error);

        EXPECT_EQ(onMain(), Happened{"alert"});
        EXPECT_EQ(dialog.lock()->alert->message, "It failed.");
        EXPECT_EQ(dialog.lock()->alert->information, "");
    }
    dialog.lock()->dismiss();
    EXPECT_EQ(reportedError, std::nullopt);
    workQueues().runMain();
}

TEST_F(Finish, FailedWithoutADialogReportsAtOnce) {
    operation->setReply(reply());

    operation->finishWithResult(BindResult::Failed, blueSigning, refused);

    EXPECT_EQ(onMain(), Happened{"report 1"});
    EXPECT_EQ(reportedError, refused);
}

TEST_F(Finish, TwiceReportsTwice) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
    operation->finishWithResult(BindResult::Succeeded, blueSigning, std::nullopt);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2", "report 0"}));
}

TEST_F(Finish, ReportsToTheEndEvenWhenItsOwnerIsGone) {
    operation->setReply(reply());
    operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
    operation.reset();

    EXPECT_EQ(onMain(), Happened{"report 2"});
}

TEST_F(Finish, WithoutAReplyOnlyClosesTheDialog) {
    startWithBlueShown();
    operation->setReply(nullptr);

    operation->finishWithResult(BindResult::Succeeded, blueSigning, std::nullopt);

    EXPECT_EQ(onMain(), Happened{"close"});
}

TEST_F(Finish, LetsGoOfTheOperationAndItsDialog) {
    startWithBlueShown();
    const std::weak_ptr<BindOperation> gone = operation;
    operation->finishWithResult(BindResult::Succeeded, blueSigning, std::nullopt);

    workQueues().runMain();
    EXPECT_TRUE(dialog.expired());
    operation.reset();

    EXPECT_TRUE(gone.expired());
    EXPECT_TRUE(tokens.watcher.expired());
    events.take();
}

TEST_F(Finish, LetsGoOfBothAfterAnAlertThatNobodyDismissed) {
    startWithBlueShown();
    const std::weak_ptr<BindOperation> gone = operation;
    operation->finishWithResult(BindResult::Failed, blueSigning, refused);
    ASSERT_EQ(onMain(), Happened{"alert"});
    operation.reset();

    pull(blue);

    EXPECT_EQ(onMain(), (Happened{"close", "report 2"}));
    EXPECT_TRUE(dialog.expired());
    EXPECT_TRUE(gone.expired());
}

TEST_F(Finish, KeepsTheDialogUntilItsCallIsOver) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Failed, blueSigning, refused);
    ASSERT_EQ(onMain(), Happened{"alert"});
    const auto dismiss = dialog.lock()->dismiss;

    dismiss();

    EXPECT_FALSE(dialog.expired());
    EXPECT_EQ(operation->dialog(), nullptr);
    EXPECT_EQ(events.take(), (Happened{"close", "report 1"}));
    workQueues().runMain();
    EXPECT_TRUE(dialog.expired());
}

TEST_F(Finish, DismissedWhenTheOperationIsGoneIsForNobody) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Failed, blueSigning, refused);
    ASSERT_EQ(onMain(), Happened{"alert"});
    const auto late = dialog.lock()->dismiss;
    pull(blue);
    ASSERT_EQ(onMain(), (Happened{"close", "report 2"}));
    operation.reset();

    late();

    EXPECT_EQ(onMain(), Happened());
}

TEST_F(Finish, DismissedAfterTheDialogWasClosedReportsAgain) {
    startWithBlueShown();
    operation->finishWithResult(BindResult::Failed, blueSigning, refused);
    ASSERT_EQ(onMain(), Happened{"alert"});
    const auto late = dialog.lock()->dismiss;
    pull(blue);
    ASSERT_EQ(onMain(), (Happened{"close", "report 2"}));

    late();

    EXPECT_EQ(events.take(), Happened{"report 1"});
}

}  // namespace
}  // namespace vlm
