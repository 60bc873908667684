#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

class BindDialogButtons : public BindDialogTest {
protected:
    void SetUp() override {
        BindDialogTest::SetUp();
        offer({{blue, {{{1}, "A"}, {{2}, "B"}}}});
        dialog->showWindow();
    }
};

TEST_F(BindDialogButtons, PairIsForTheSelectedIdentity) {
    popUp().choose(1);

    EXPECT_TRUE(screen().click("okButton"));

    EXPECT_EQ(calls, Strings{"ok"});
    EXPECT_EQ(paired, Bytes{2});
    EXPECT_EQ(actedOn, operation);
}

TEST_F(BindDialogButtons, PairIsForTheFirstIdentityWhenNobodyChose) {
    screen().click("okButton");

    EXPECT_EQ(paired, Bytes{1});
}

TEST_F(BindDialogButtons, PairIsForNoIdentityWhenThereIsNone) {
    offer({});
    dialog->refreshIdentities();

    screen().click("okButton");

    EXPECT_EQ(calls, Strings{"ok"});
    EXPECT_EQ(paired, std::nullopt);
}

TEST_F(BindDialogButtons, PairIsForNoIdentityWhenASeparatorIsFirst) {
    offer({{blue, {}}, {red, {{{1}, "A"}}}});
    dialog->refreshIdentities();

    screen().click("okButton");

    EXPECT_EQ(paired, std::nullopt);
}

TEST_F(BindDialogButtons, PairDisablesTheControls) {
    screen().click("okButton");

    EXPECT_FALSE(popUp().enabled);
    EXPECT_FALSE(screen().click("okButton"));
    EXPECT_FALSE(screen().click("cancelButton"));
    EXPECT_EQ(calls, Strings{"ok"});
}

TEST_F(BindDialogButtons, PairDisablesTheControlsBeforeItsAction) {
    bool enabled = true;
    auto watching = actions();
    watching.okClicked = [&](const auto&, const auto&) {
        enabled = windowing().windows.back()->content.find("okButton")->enabled;
    };
    dialog = BindDialog::initWithOperation(operation, watching);
    dialog->showWindow();

    windowing().windows.back()->click("okButton");

    EXPECT_FALSE(enabled);
}

TEST_F(BindDialogButtons, CancelIsForTheOperation) {
    EXPECT_TRUE(screen().click("cancelButton"));

    EXPECT_EQ(calls, Strings{"cancel"});
    EXPECT_EQ(actedOn, operation);
    EXPECT_TRUE(part("okButton").enabled);
}

TEST_F(BindDialogButtons, TheWindowsOwnCloseButtonCancels) {
    screen().clickClose();

    EXPECT_EQ(calls, Strings{"cancel"});
}

TEST_F(BindDialogButtons, DoNotShowAgainIsForTheOperation) {
    EXPECT_TRUE(screen().click("dontShowAgainButton"));

    EXPECT_EQ(calls, Strings{"dontShowAgain"});
    EXPECT_EQ(actedOn, operation);
}

TEST_F(BindDialogButtons, AnActionMayLetTheDialogGo) {
    auto leaving = actions();
    leaving.cancelClicked = [this, held = std::string("what the action needs")](const auto& of) {
        dialog->close();
        dialog.reset();
        calls.push_back(held);
        actedOn = of;
    };
    dialog = BindDialog::initWithOperation(operation, leaving);
    dialog->showWindow();

    windowing().windows.back()->click("cancelButton");

    EXPECT_EQ(calls, Strings{"what the action needs"});
    EXPECT_EQ(actedOn, operation);
}

}  // namespace
}  // namespace vlm
