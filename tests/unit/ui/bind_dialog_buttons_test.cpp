#include "bind_dialog_fixture.h"
#include "platform/preferences.h"
#include "util/bind_utils.h"

namespace vlm {
namespace {

using platform::LogLevel;

constexpr const char* kCanceled = "result: 2, pubKeyHash: (null), error: (null)";

class BindDialogButtons : public BindDialogTest {
protected:
    void SetUp() override {
        BindDialogTest::SetUp();
        offerBlueCard();
        dialog->showWindow();
    }

    // Clicks, and does all that follows.
    void pair() {
        EXPECT_TRUE(screen().click("okButton"));
        workQueues().runBackground();
        workQueues().runMain();
    }

    bool selected(const std::string& hash) {
        return log().has(LogLevel::Debug, "selected pubkey hash: " + hash);
    }
};

TEST_F(BindDialogButtons, PairIsForTheSelectedIdentity) {
    popUp().choose(1);

    pair();

    EXPECT_TRUE(selected("<02>"));
    EXPECT_EQ(service.pairings, (std::vector<std::pair<std::string, Bytes>>{{"alice", {2}}}));
}

TEST_F(BindDialogButtons, PairIsForTheFirstIdentityWhenNobodyChose) {
    pair();

    EXPECT_TRUE(selected("<01>"));
    EXPECT_EQ(service.pairings, (std::vector<std::pair<std::string, Bytes>>{{"alice", {1}}}));
}

TEST_F(BindDialogButtons, PairIsForNoIdentityWhenThereIsNone) {
    offer({});
    dialog->refreshIdentities();

    pair();

    EXPECT_TRUE(selected("(null)"));
    EXPECT_TRUE(log().has(LogLevel::Default, "cannot find unpaired public key hash: (null)"));
    EXPECT_EQ(finishes(), Strings{"result: 1, pubKeyHash: (null), error: VLErrorDomain error -8"});
    EXPECT_TRUE(service.pairings.empty());
}

TEST_F(BindDialogButtons, PairIsForNoIdentityWhenASeparatorIsFirst) {
    offer({{blue, {}}, {red, {{{1}, "A"}}}});
    dialog->refreshIdentities();

    pair();

    EXPECT_TRUE(selected("(null)"));
    EXPECT_TRUE(service.pairings.empty());
}

TEST_F(BindDialogButtons, PairIsForTheIdentityThatWasSelectedThen) {
    popUp().choose(1);
    screen().click("okButton");
    popUp().choose(0);

    workQueues().runBackground();
    workQueues().runMain();

    EXPECT_EQ(service.pairings, (std::vector<std::pair<std::string, Bytes>>{{"alice", {2}}}));
}

TEST_F(BindDialogButtons, PairNeedsNoPopUp) {
    dialog->setIdentityPopup(nullptr);

    pair();

    EXPECT_TRUE(selected("(null)"));
    EXPECT_EQ(finishes().size(), 1U);
}

TEST_F(BindDialogButtons, PairDisablesTheControlsForGood) {
    screen().click("okButton");

    EXPECT_FALSE(popUp().enabled);
    EXPECT_FALSE(screen().click("okButton"));
    EXPECT_FALSE(screen().click("cancelButton"));
    EXPECT_FALSE(screen().click("dontShowAgainButton"));

    workQueues().runBackground();
    workQueues().runMain();
    EXPECT_FALSE(popUp().enabled);
    EXPECT_EQ(finishes().size(), 1U);
}

TEST_F(BindDialogButtons, PairReturnsBeforeAnythingIsAskedFor) {
    screen().click("okButton");

    EXPECT_EQ(authorization().sessions, 0);
    EXPECT_TRUE(service.requests.empty());
    EXPECT_TRUE(finishes().empty());
    workQueues().runBackground();
    workQueues().runMain();
}

TEST_F(BindDialogButtons, PairLabelsWhatItDoesOnEveryThread) {
    pair();

    EXPECT_EQ(activities(), Strings{"clicked 'Pair'"});
}

TEST_F(BindDialogButtons, CancelFinishesTheOperation) {
    EXPECT_TRUE(screen().click("cancelButton"));

    EXPECT_EQ(finishes(), Strings{kCanceled});
    EXPECT_TRUE(part("okButton").enabled);
    workQueues().runMain();
    EXPECT_EQ(replies, std::vector{BindResult::Canceled});
    EXPECT_EQ(repliedError, std::nullopt);
    EXPECT_EQ(authorization().sessions, 0);
    EXPECT_TRUE(BindUtils::isBindAllowed());
}

TEST_F(BindDialogButtons, CancelLabelsWhatItDoes) {
    screen().click("cancelButton");

    EXPECT_EQ(activities(), Strings{"clicked 'Cancel'"});
    workQueues().runMain();
}

TEST_F(BindDialogButtons, TheWindowsOwnCloseButtonCancels) {
    screen().clickClose();

    EXPECT_EQ(finishes(), Strings{kCanceled});
    workQueues().runMain();
}

TEST_F(BindDialogButtons, DoNotShowAgainDisallowsForTheUserAndFinishesTheOperation) {
    EXPECT_TRUE(screen().click("dontShowAgainButton"));

    EXPECT_EQ(finishes(), Strings{kCanceled});
    EXPECT_FALSE(BindUtils::isBindAllowed());
    using User = platform::PreferencesUser;
    EXPECT_EQ(preferences().synchronised.size(), 1U);
    EXPECT_EQ(preferences().synchronised.at(0).second, User::Current);
    workQueues().runMain();
    EXPECT_EQ(replies, std::vector{BindResult::Canceled});
    EXPECT_EQ(repliedError, std::nullopt);
    EXPECT_EQ(authorization().sessions, 0);
}

TEST_F(BindDialogButtons, DoNotShowAgainDisallowsBeforeItFinishes) {
    screen().click("dontShowAgainButton");

    const auto lines = log().lines();
    ASSERT_EQ(lines.size(), 2U);
    EXPECT_EQ(lines[0].text, "set UserPairing allowed: 0, result: 1");
    EXPECT_TRUE(lines[1].text.starts_with("finishWithResult"));
    workQueues().runMain();
}

TEST_F(BindDialogButtons, DoNotShowAgainFinishesAlsoWhenItCannotBeWritten) {
    preferences().refuseWrites();

    screen().click("dontShowAgainButton");

    EXPECT_EQ(finishes(), Strings{kCanceled});
    workQueues().runMain();
}

TEST_F(BindDialogButtons, DoNotShowAgainLabelsWhatItDoes) {
    screen().click("dontShowAgainButton");

    EXPECT_EQ(activities(), Strings{"clicked 'Do not show again'"});
    workQueues().runMain();
}

TEST_F(BindDialogButtons, TheDialogMayGoWhileAButtonIsClicked) {
    operation->setDialog(dialog);
    const std::weak_ptr<BindDialog> gone = dialog;
    dialog.reset();

    screen().click("cancelButton");
    workQueues().runMain();

    EXPECT_TRUE(screen().closed);
    EXPECT_TRUE(gone.expired());
    EXPECT_EQ(replies, std::vector{BindResult::Canceled});
}

}  // namespace
}  // namespace vlm
