// The pairing dialog on the real window.

#include "ui/bind_dialog.h"

#include <gtest/gtest.h>

#include <QComboBox>
#include <QLabel>
#include <QPushButton>
#include <QTest>

#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

class BindDialogOnScreen : public ::testing::Test {
protected:
    void SetUp() override {
        windowingOnScreen();
        operation->setUnpairedIdentities(BindOperation::UnpairedIdentities{
            {"blue", {{{1}, "Bob"}, {{2}, "Alice"}}}, {"red", {{{3}, "Carol"}}}});
        dialog->showWindow();
        ASSERT_TRUE(bindDialog());
    }
    void TearDown() override {
        dialog.reset();
        settle();
    }

    std::vector<std::string> calls;
    BindOperation::OptionalHash paired;
    std::shared_ptr<BindOperation> operation = BindOperation::initWithUserName("alice");
    std::shared_ptr<BindDialog> dialog = BindDialog::initWithOperation(
        operation, {[this](const auto&, const auto& hash) { paired = hash; },
                    [this](const auto&) {
                        dialog->close();
                        dialog.reset();
                        calls.push_back("cancel");
                    },
                    [this](const auto&) { calls.push_back("dontShowAgain"); }});
};

TEST_F(BindDialogOnScreen, ListsTheIdentitiesInGroups) {
    const auto& box = part<QComboBox>("identityPopup");

    ASSERT_EQ(box.count(), 4);
    EXPECT_EQ(box.itemText(0).toStdString(), "Alice");
    EXPECT_EQ(box.itemText(1).toStdString(), "Bob");
    EXPECT_EQ(box.itemData(2, Qt::AccessibleDescriptionRole).toString().toStdString(), "separator");
    EXPECT_EQ(box.itemText(3).toStdString(), "Carol");
    EXPECT_EQ(box.currentIndex(), 0);
}

TEST_F(BindDialogOnScreen, PairsTheIdentityThatWasChosenWithTheKeyboard) {
    auto& box = part<QComboBox>("identityPopup");
    QTest::keyClick(&box, Qt::Key_Down);
    QTest::keyClick(&box, Qt::Key_Down);  // over the separator

    click("okButton");

    EXPECT_EQ(paired, platform::Bytes{3});
}

TEST_F(BindDialogOnScreen, PairingDisablesEveryControl) {
    click("okButton");

    EXPECT_FALSE(part<QComboBox>("identityPopup").isEnabled());
    for (const char* button : {"okButton", "cancelButton", "dontShowAgainButton"})
        EXPECT_FALSE(part<QPushButton>(button).isEnabled()) << button;
    EXPECT_TRUE(part<QLabel>("messageLabel").isEnabled());
}

TEST_F(BindDialogOnScreen, ClosingTheWindowCancelsAndMayLetTheDialogGo) {
    bindDialog()->close();
    settle();

    EXPECT_EQ(calls, std::vector<std::string>{"cancel"});
    EXPECT_EQ(bindDialog(), nullptr);
}

}  // namespace
}  // namespace vlm::test
