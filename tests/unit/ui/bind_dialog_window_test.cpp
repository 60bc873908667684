#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

class BindDialogWindow : public BindDialogTest {
protected:
    // How often an alert's dismissal was told.
    int dismissals = 0;
    const platform::Alert alert{platform::AlertStyle::Critical, "Failed", "Because", "OK"};
    void showAlert() {
        dialog->showAlert(alert, [this] { ++dismissals; });
    }
};

TEST_F(BindDialogWindow, IsNotLoadedBeforeItIsNeeded) {
    EXPECT_TRUE(windowing().record.empty());
    EXPECT_EQ(dialog->iconView(), nullptr);
    EXPECT_EQ(dialog->identityLabel(), nullptr);
    EXPECT_EQ(dialog->identityPopup(), nullptr);
}

TEST_F(BindDialogWindow, IsDressedAndShownInThisOrder) {
    EXPECT_TRUE(dialog->showWindow());

    EXPECT_EQ(windowing().record,
              (Strings{"load BindDialog", "level 999", "centre", "key", "activate"}));
    EXPECT_TRUE(screen().shown);
}

TEST_F(BindDialogWindow, IsBroughtToTheFrontWhenItIsShownAgain) {
    dialog->showWindow();
    windowing().record.clear();

    EXPECT_TRUE(dialog->showWindow());

    EXPECT_EQ(windowing().record, Strings{"key"});
}

TEST_F(BindDialogWindow, ThatWasClosedIsNotShownAgain) {
    dialog->showWindow();
    dialog->close();

    EXPECT_FALSE(dialog->showWindow());
    EXPECT_FALSE(screen().shown);
}

TEST_F(BindDialogWindow, IsFilledWhenItIsLoaded) {
    offer({{blue, {{{1}, "A"}}}});

    EXPECT_NE(dialog->window(), nullptr);

    EXPECT_EQ(offered(), Strings{"A"});
}

TEST_F(BindDialogWindow, ShowsTheLockWithTheProgramsIcon) {
    dialog->showWindow();

    const auto* icon = screen().content.find<fakes::FakeIconView>("iconView");
    EXPECT_EQ(icon->badge, "AppIcon");
    EXPECT_EQ(icon->points, 32);
}

TEST_F(BindDialogWindow, GivesItsOutlets) {
    dialog->showWindow();

    EXPECT_EQ(dialog->iconView(), screen().content.find<fakes::FakeIconView>("iconView"));
    EXPECT_EQ(dialog->identityLabel(),
              screen().content.find<fakes::FakeTextLabel>("identityLabel"));
    EXPECT_EQ(dialog->identityPopup(), &popUp());
}

TEST_F(BindDialogWindow, TakesOtherOutlets) {
    fakes::FakeIconView icon("icon");
    fakes::FakeTextLabel label("label");
    fakes::FakePopUpButton other("popup");
    offer({{blue, {{{1}, "A"}}}});

    dialog->setIconView(&icon);
    dialog->setIdentityLabel(&label);
    dialog->setIdentityPopup(&other);
    dialog->refreshIdentities();

    EXPECT_EQ(dialog->iconView(), &icon);
    EXPECT_EQ(dialog->identityLabel(), &label);
    EXPECT_EQ(other.items.size(), 1U);
}

TEST_F(BindDialogWindow, NeedsNoneOfItsParts) {
    windowing().describe("BindDialog", [](fakes::FakeScreenWindow&) {});
    offer({{blue, {{{1}, "A"}}}});

    dialog->showWindow();
    dialog->setEnabled(false);

    EXPECT_TRUE(screen().shown);
}

TEST_F(BindDialogWindow, ThatCannotBeLoadedLeavesEverythingToBeAsked) {
    windowing().describe("BindDialog", nullptr);

    EXPECT_FALSE(dialog->showWindow());
    dialog->refreshIdentities();
    dialog->setEnabled(false);
    dialog->setEnabled(true);
    dialog->close();

    EXPECT_TRUE(windowing().windows.empty());
}

TEST_F(BindDialogWindow, IsClosed) {
    dialog->showWindow();

    dialog->close();

    EXPECT_TRUE(screen().closed);
    EXPECT_EQ(finishes(), Strings{}) << "closing is no click";
}

TEST_F(BindDialogWindow, GoesWithTheDialog) {
    dialog->showWindow();

    dialog.reset();

    EXPECT_TRUE(screen().closed);
}

TEST_F(BindDialogWindow, LetsTheOperationGoWithTheDialog) {
    dialog->showWindow();
    EXPECT_GT(operation.use_count(), 1);

    dialog.reset();

    EXPECT_EQ(operation.use_count(), 1);
}

TEST_F(BindDialogWindow, ShowsAnAlertAsASheetAndTellsOfItsDismissal) {
    dialog->showWindow();

    showAlert();
    ASSERT_EQ(screen().sheets.size(), 1U);
    EXPECT_EQ(screen().sheets[0].style, alert.style);
    EXPECT_EQ(screen().sheets[0].message, alert.message);
    EXPECT_EQ(screen().sheets[0].information, alert.information);
    EXPECT_EQ(screen().sheets[0].button, alert.button);
    EXPECT_EQ(dismissals, 0);
    EXPECT_FALSE(screen().closed);

    screen().dismissSheet();
    EXPECT_EQ(dismissals, 1);
}

TEST_F(BindDialogWindow, AnAlertBeforeItIsShownLoadsIt) {
    showAlert();

    EXPECT_EQ(screen().sheets.size(), 1U);
    EXPECT_TRUE(screen().shown);
}

TEST_F(BindDialogWindow, WithoutItAnAlertCountsAsDismissed) {
    windowing().describe("BindDialog", nullptr);

    showAlert();

    EXPECT_EQ(dismissals, 1);
}

TEST_F(BindDialogWindow, OnceClosedAnAlertCountsAsDismissed) {
    dialog->showWindow();
    dialog->close();

    showAlert();

    EXPECT_EQ(dismissals, 1);
    EXPECT_TRUE(screen().sheets.empty());
}

TEST_F(BindDialogWindow, ClosingDropsAnAlertWithoutADismissal) {
    dialog->showWindow();
    showAlert();

    dialog->close();

    EXPECT_EQ(dismissals, 0);
}

TEST_F(BindDialogWindow, MayBeLetGoWhenAnAlertIsDismissed) {
    dialog->showWindow();
    dialog->showAlert(alert, [this] {
        dialog->close();
        dialog.reset();
        ++dismissals;
    });

    screen().dismissSheet();

    EXPECT_EQ(dismissals, 1);
    EXPECT_TRUE(screen().closed);
}

}  // namespace
}  // namespace vlm
