// What Pair comes to, for each of its ends.

#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

using fakes::FakeHintsService;
using platform::LogLevel;

class BindDialogPairing : public BindDialogTest {
protected:
    void SetUp() override {
        BindDialogTest::SetUp();
        localization().translate("OK", "Fine");
        localization().translate("AUTH_ERROR", "Not allowed: {}.");
        localization().translate("STORE_UNLOCK_KEY_FAILED", "No unlock key.");
        localization().translate("STORE_UNLOCK_KEY_FAILED_INFO", "You need your password.");
        offerBlueCard();
        dialog->showWindow();
    }

    // Clicks, and does in the background what that asks for.
    void pair() {
        EXPECT_TRUE(screen().click("okButton"));
        workQueues().runBackground();
        EXPECT_TRUE(finishes().empty()) << "the operation is finished on the main queue";
        EXPECT_TRUE(screen().sheets.empty()) << "the window is the main queue's";
    }
    void pairToTheEnd() {
        pair();
        workQueues().runMain();
    }

    bool debugged(const std::string& text) { return log().has(LogLevel::Debug, text); }

    const Strings paired{"result: 0, pubKeyHash: <01>, error: (null)"};
};

TEST_F(BindDialogPairing, AsksForTheAdministratorsRightOnce) {
    pairToTheEnd();

    EXPECT_EQ(authorization().asked, Strings{"org.vlm.vlmbind.admin"});
    EXPECT_EQ(authorization().requested, Strings{"org.vlm.vlmbind.admin"});
    EXPECT_EQ(authorization().sessions, 1);
}

TEST_F(BindDialogPairing, ThatWorksFinishesWithTheHash) {
    pairToTheEnd();

    EXPECT_EQ(finishes(), paired);
    EXPECT_TRUE(screen().sheets.empty());
    EXPECT_EQ(replies, std::vector{BindResult::Succeeded});
    EXPECT_EQ(repliedError, std::nullopt);
    ASSERT_EQ(keychain().stored.size(), 1U);
    EXPECT_EQ(keychain().stored[0].hash, Bytes{1});
}

TEST_F(BindDialogPairing, RequiresAWrapKey) {
    operation->setUnpairedIdentities(std::nullopt);
    service.remove(blue);
    service.insert({red, "Red Card", {{{1}, "A"}}, std::nullopt});

    pairToTheEnd();

    EXPECT_TRUE(
        log().has(LogLevel::Default, "updateTokenCache for token: (null) (requireWrapKey: 1)"));
    EXPECT_TRUE(service.pairings.empty());
}

TEST_F(BindDialogPairing, WithoutASessionFailsWithItsStatus) {
    authorization().refuseSessions(-60031);

    pairToTheEnd();

    EXPECT_TRUE(debugged("failed to create authorization: -60031"));
    EXPECT_EQ(finishes(), Strings{"result: 1, pubKeyHash: <01>, error: VLErrorDomain error -5: "
                                  "Not allowed: -60031."});
    EXPECT_EQ(replies, std::vector{BindResult::Failed});
    EXPECT_EQ(repliedError, (Error{"VLErrorDomain", -5, "Not allowed: -60031."}));
    EXPECT_TRUE(authorization().requested.empty());
    EXPECT_TRUE(service.requests.empty());
}

TEST_F(BindDialogPairing, IsCanceledWithTheHashWhenThePromptIsDismissed) {
    authorization().dismiss();

    pairToTheEnd();

    EXPECT_TRUE(debugged("authorization canceled"));
    EXPECT_EQ(finishes(), Strings{"result: 2, pubKeyHash: <01>, error: (null)"});
    EXPECT_EQ(replies, std::vector{BindResult::Canceled});
    EXPECT_EQ(repliedError, std::nullopt);
    EXPECT_TRUE(service.requests.empty());
}

TEST_F(BindDialogPairing, FailsWithEveryOtherStatusOfTheAuthorization) {
    for (const platform::Status status : {-60005, -60007, -60008, -60031, -1, 1}) {
        operation->setDialog(nullptr);
        dialog = BindDialog::initWithOperation(operation);
        dialog->showWindow();
        authorization().answerWith(status);

        screen().click("okButton");
        workQueues().runBackground();
        workQueues().runMain();

        const auto number = std::to_string(status);
        EXPECT_TRUE(debugged("authorization failed: " + number));
        EXPECT_EQ(finishes().back(),
                  "result: 1, pubKeyHash: <01>, error: VLErrorDomain error -5: Not allowed: " +
                      number + ".");
        EXPECT_EQ(replies.back(), BindResult::Failed);
        EXPECT_EQ(repliedError, (Error{"VLErrorDomain", -5, "Not allowed: " + number + "."}));
    }
    EXPECT_EQ(finishes().size(), 6U);
    EXPECT_FALSE(debugged("authorization canceled"));
    EXPECT_TRUE(service.requests.empty());
}

TEST_F(BindDialogPairing, EndsItsSessionWhateverTheAnswer) {
    for (const platform::Status status : {0, -60005, -60006}) {
        authorization().answerWith(status);
        dialog = BindDialog::initWithOperation(operation);
        dialog->showWindow();

        screen().click("okButton");
        workQueues().runBackground();
        workQueues().runMain();

        EXPECT_EQ(authorization().openSessions, 0) << status;
    }
    EXPECT_EQ(authorization().sessions, 3);
}

TEST_F(BindDialogPairing, EndsItsSessionBeforeItPairs) {
    ipc().serve([this](const platform::Message& request) {
        EXPECT_EQ(authorization().openSessions, 0);
        EXPECT_EQ(authorization().sessions, 1);
        return service.answer(request);
    });

    pairToTheEnd();

    EXPECT_EQ(finishes(), paired);
}

TEST_F(BindDialogPairing, ThatIsRefusedFailsWithTheErrorOfTheRefusal) {
    const Error why{"VLErrorDomain", -2004, "The PIN was wrong."};
    service.failWith(FakeHintsService::kPerformLogin, -2004, why);

    pairToTheEnd();

    EXPECT_EQ(finishes(), Strings{"result: 1, pubKeyHash: <01>, error: VLErrorDomain error "
                                  "-2004: The PIN was wrong."});
    EXPECT_EQ(replies, std::vector{BindResult::Failed});
    EXPECT_EQ(repliedError, why);
    EXPECT_TRUE(keychain().asked.empty());
}

TEST_F(BindDialogPairing, ThatFailsWithoutAnErrorFailsWithoutOne) {
    service.failWith(FakeHintsService::kPerformLogin, -2004);

    pairToTheEnd();

    EXPECT_EQ(finishes(), Strings{"result: 1, pubKeyHash: <01>, error: (null)"});
}

TEST_F(BindDialogPairing, WithoutAnUnlockKeySaysSoFirstAndFinishesThen) {
    keychain().failWith(-2022);

    pairToTheEnd();

    ASSERT_EQ(screen().sheets.size(), 1U);
    const auto& alert = screen().sheets[0];
    EXPECT_EQ(alert.style, platform::AlertStyle::Critical);
    EXPECT_EQ(alert.message, "No unlock key.");
    EXPECT_EQ(alert.information, "You need your password.");
    EXPECT_EQ(alert.button, "Fine");
    EXPECT_TRUE(finishes().empty());
    EXPECT_TRUE(replies.empty());
    EXPECT_EQ(service.pairings.size(), 1U);

    screen().dismissSheet();
    EXPECT_EQ(finishes(), paired);
    workQueues().runMain();
    EXPECT_EQ(replies, std::vector{BindResult::Succeeded});
    EXPECT_EQ(repliedError, std::nullopt);
}

TEST_F(BindDialogPairing, WithoutAnUnlockKeyFinishesAtOnceWhenTheWindowIsClosed) {
    keychain().failWith(-2022);
    pair();
    dialog->close();

    workQueues().runMain();

    EXPECT_EQ(finishes(), paired);
}

TEST_F(BindDialogPairing, AnAlertThatNobodyDismissesKeepsNothing) {
    keychain().failWith(-2022);
    pairToTheEnd();
    const std::weak_ptr<BindDialog> gone = dialog;

    dialog.reset();

    EXPECT_TRUE(gone.expired());
    EXPECT_EQ(operation.use_count(), 1);
}

TEST_F(BindDialogPairing, LogsNothingOfItsOwnWhereNothingIsRefused) {
    pairToTheEnd();

    for (const auto& line : log().lines())
        EXPECT_FALSE(line.text.find("authorization") != std::string::npos) << line.text;
}

}  // namespace
}  // namespace vlm
