#include "bind_dialog_fixture.h"

namespace vlm {
namespace {

class SetEnabled : public BindDialogTest {
protected:
    void SetUp() override {
        BindDialogTest::SetUp();
        dialog->showWindow();
    }

    std::vector<bool> enablings(const std::string& name) { return part(name).enablings; }
};

using Calls = std::vector<bool>;

TEST_F(SetEnabled, BeforeAnyDisablingChangesNothing) {
    part("okButton").enabled = false;

    dialog->setEnabled(true);

    EXPECT_FALSE(part("okButton").enabled);
    EXPECT_EQ(enablings("cancelButton"), Calls{});
}

TEST_F(SetEnabled, BeforeAnyDisablingCapturesNothing) {
    part("okButton").enabled = false;
    dialog->setEnabled(true);
    part("okButton").enabled = true;

    dialog->setEnabled(false);

    EXPECT_FALSE(part("okButton").enabled);
}

TEST_F(SetEnabled, DisablesEachControlAndNothingElse) {
    dialog->setEnabled(false);

    for (const char* control : {"identityPopup", "dontShowAgainButton", "cancelButton", "okButton"})
        EXPECT_EQ(enablings(control), Calls{false}) << control;
    for (const char* view : {"content", "iconView", "identityLabel", "buttonRow"})
        EXPECT_EQ(enablings(view), Calls{}) << view;
}

TEST_F(SetEnabled, EnablesAgainWhatItDisabled) {
    dialog->setEnabled(false);
    dialog->setEnabled(true);

    EXPECT_EQ(enablings("okButton"), (Calls{false, true}));
    EXPECT_TRUE(part("okButton").enabled);
}

TEST_F(SetEnabled, NeverTouchesWhatWasDisabledBefore) {
    part("okButton").enabled = false;

    dialog->setEnabled(false);
    dialog->setEnabled(true);

    EXPECT_EQ(enablings("okButton"), Calls{});
    EXPECT_FALSE(part("okButton").enabled);
}

TEST_F(SetEnabled, ALaterDisablingTakesTheControlsOfTheFirstOne) {
    part("okButton").enabled = false;
    dialog->setEnabled(false);
    dialog->setEnabled(true);
    part("okButton").enabled = true;
    part("cancelButton").enabled = false;
    screen().content.add<fakes::FakeButton>("helpButton");

    dialog->setEnabled(false);

    EXPECT_EQ(enablings("okButton"), Calls{});
    EXPECT_EQ(enablings("cancelButton"), (Calls{false, true, false}));
    EXPECT_EQ(enablings("helpButton"), Calls{});
}

TEST_F(SetEnabled, DisablingTwiceTellsTheControlsTwice) {
    dialog->setEnabled(false);
    dialog->setEnabled(false);

    EXPECT_EQ(enablings("okButton"), (Calls{false, false}));
}

TEST_F(SetEnabled, AnEmptyCaptureIsKeptToo) {
    for (const char* control : {"identityPopup", "dontShowAgainButton", "cancelButton", "okButton"})
        part(control).enabled = false;
    dialog->setEnabled(false);
    part("okButton").enabled = true;

    dialog->setEnabled(false);

    EXPECT_TRUE(part("okButton").enabled);
}

class EnabledObjects : public ::testing::Test {
protected:
    using Kind = fakes::FakeView::Kind;

    fakes::FakeView root{"root", Kind::Control};
    BindDialog::Controls found;
};

TEST_F(EnabledObjects, AreEverythingBelowAViewParentsFirst) {
    auto& group = root.add("group", Kind::Control);
    auto& first = group.add("first", Kind::Control);
    auto& plain = root.add("plain");
    auto& second = plain.add("second", Kind::Control);
    auto& last = root.add("last", Kind::Control);

    BindDialog::enabledObjects(found, root);

    EXPECT_EQ(found, (BindDialog::Controls{group.control(), first.control(), second.control(),
                                           last.control()}));
}

TEST_F(EnabledObjects, AreLookedForBelowADisabledOneToo) {
    auto& group = root.add("group", Kind::Control);
    auto& button = group.add("button", Kind::Control);
    group.enabled = false;

    BindDialog::enabledObjects(found, root);

    EXPECT_EQ(found, BindDialog::Controls{button.control()});
}

TEST_F(EnabledObjects, AreAddedToWhatIsInTheList) {
    auto& button = root.add("button", Kind::Control);
    found = {root.control()};

    BindDialog::enabledObjects(found, root);

    EXPECT_EQ(found, (BindDialog::Controls{root.control(), button.control()}));
}

TEST_F(EnabledObjects, OfAViewWithoutPartsAreNone) {
    BindDialog::enabledObjects(found, root);

    EXPECT_TRUE(found.empty());
}

}  // namespace
}  // namespace vlm
