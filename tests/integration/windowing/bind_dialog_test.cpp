// The pairing dialog on the real window.

#include "ui/bind_dialog.h"

#include <gtest/gtest.h>

#include <QComboBox>
#include <QLabel>
#include <QPushButton>
#include <QTest>
#include <cstdlib>
#include <functional>

#include "platform/linux/event_loop_work_queues.h"
#include "tests/integration/linux/child.h"
#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

class BindDialogOnScreen : public ::testing::Test {
protected:
    void SetUp() override {
        // Nobody can be asked for a right, so that every pairing fails in its own way.
        ::setenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nowhere", 1);
        windowingOnScreen();
        operation->setUnpairedIdentities(BindOperation::UnpairedIdentities{
            {"blue", {{{1}, "Bob"}, {{2}, "Alice"}}}, {"red", {{{3}, "Carol"}}}});
        operation->setReply([this](BindResult result, const std::optional<platform::Error>& why) {
            replies.push_back(result);
            error = why;
        });
        operation->setDialog(dialog);
        dialog->showWindow();
        ASSERT_TRUE(bindDialog());
    }
    void TearDown() override {
        operation->setDialog(nullptr);
        dialog.reset();
        settle();
        ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
    }

    // Whether it becomes so while the main queue is worked off.
    bool becomes(const std::function<bool()>& isSo) {
        return eventually([&] {
            platform::mainLoop().dispatch();
            settle();
            return isSo();
        });
    }

    std::vector<BindResult> replies;
    std::optional<platform::Error> error;
    std::shared_ptr<BindOperation> operation = BindOperation::initWithUserName("alice");
    std::shared_ptr<BindDialog> dialog = BindDialog::initWithOperation(operation);
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

TEST_F(BindDialogOnScreen, SelectsTheIdentityThatWasChosenWithTheKeyboard) {
    auto& box = part<QComboBox>("identityPopup");
    QTest::keyClick(&box, Qt::Key_Down);
    QTest::keyClick(&box, Qt::Key_Down);  // over the separator

    EXPECT_EQ(dialog->identityPopup()->selectedItem()->object, platform::Bytes{3});
}

TEST_F(BindDialogOnScreen, PairingDisablesEveryControl) {
    click("okButton");

    EXPECT_FALSE(part<QComboBox>("identityPopup").isEnabled());
    for (const char* button : {"okButton", "cancelButton", "dontShowAgainButton"})
        EXPECT_FALSE(part<QPushButton>(button).isEnabled()) << button;
    EXPECT_TRUE(part<QLabel>("messageLabel").isEnabled());
    EXPECT_TRUE(becomes([] { return sheet(); }));
}

TEST_F(BindDialogOnScreen, APairingWithoutTheRightFailsAfterAnAlert) {
    click("okButton");
    ASSERT_TRUE(becomes([] { return sheet(); }));
    EXPECT_TRUE(sheet()->informativeText().contains("-60008"))
        << sheet()->informativeText().toStdString();
    EXPECT_TRUE(replies.empty());

    QTest::keyClick(sheet(), Qt::Key_Return);

    ASSERT_TRUE(becomes([this] { return !replies.empty(); }));
    EXPECT_EQ(replies, std::vector{BindResult::Failed});
    EXPECT_EQ(error->code, -5);
    EXPECT_TRUE(becomes([] { return !bindDialog() || !bindDialog()->isVisible(); }));
}

TEST_F(BindDialogOnScreen, ClosingTheWindowCancelsAndMayLetTheDialogGo) {
    dialog.reset();

    bindDialog()->close();

    EXPECT_TRUE(becomes([this] { return !replies.empty(); }));
    EXPECT_EQ(replies, std::vector{BindResult::Canceled});
    EXPECT_TRUE(becomes([] { return !bindDialog(); }));
}

}  // namespace
}  // namespace vlm::test
