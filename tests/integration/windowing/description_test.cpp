// The window as its description says it looks and is used.

#include <gtest/gtest.h>

#include <QAccessible>
#include <QApplication>
#include <QComboBox>
#include <QKeySequence>
#include <QLabel>
#include <QLibraryInfo>
#include <QPushButton>
#include <QScreen>
#include <QTest>
#include <filesystem>
#include <fstream>
#include <set>
#include <sstream>

#include "tests/integration/linux/temporary_folder.h"
#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

class BindDialogDescription : public ::testing::Test {
protected:
    void SetUp() override {
        window = windowingOnScreen().loadWindow("BindDialog");
        ASSERT_TRUE(window);
        for (const char* button : {"okButton", "cancelButton", "dontShowAgainButton"})
            window->onClick(button, [this, button] { clicks.push_back(button); });
        window->popUpButton("identityPopup")->append({"Alice", platform::Bytes{1}, false});
        window->makeKeyAndOrderFront();
        ASSERT_TRUE(QTest::qWaitForWindowActive(bindDialog()));
    }
    void TearDown() override {
        window.reset();
        settle();
    }

    static std::string text(const QString& of) { return of.toStdString(); }

    std::unique_ptr<platform::Window> window;
    std::vector<std::string> clicks;
};

using Clicks = std::vector<std::string>;

TEST_F(BindDialogDescription, HasTextsOfTheCatalogue) {
    EXPECT_EQ(text(bindDialog()->windowTitle()), "SmartCard Pairing");
    EXPECT_EQ(text(part<QPushButton>("okButton").text()), "&Pair");
    EXPECT_EQ(text(part<QPushButton>("cancelButton").text()), "&Cancel");
    EXPECT_EQ(text(part<QPushButton>("dontShowAgainButton").text()), "Do &not show again");
    EXPECT_EQ(text(part<QLabel>("identityLabel").text()), "&Identity:");
}

TEST_F(BindDialogDescription, ShowsNoKeyInPlaceOfAText) {
    for (const auto* widget : bindDialog()->findChildren<QWidget*>())
        for (const char* property : {"text", "accessibleName", "accessibleDescription", "toolTip"})
            EXPECT_FALSE(widget->property(property).toString().contains("BIND_DIALOG"))
                << text(widget->objectName()) << "'s " << property;
}

// A module that is there for something else, as it would be found, and loaded, in the environment.
TEST_F(BindDialogDescription, LoadsNoModulesOfWidgets) {
    const TemporaryFolder folder;
    const auto modules = folder.path() / "designer";
    std::filesystem::create_directory(modules);
    const std::filesystem::path platforms =
        QLibraryInfo::path(QLibraryInfo::PluginsPath).toStdString() + "/platforms";
    std::filesystem::copy(platforms / "libqminimal.so", modules / "widgets.so");
    const auto before = QCoreApplication::libraryPaths();
    QCoreApplication::addLibraryPath(QString::fromStdString(folder.path().string()));
    const auto with = QCoreApplication::libraryPaths();

    ASSERT_TRUE(windowingOnScreen().loadWindow("BindDialog"));

    std::stringstream loaded;
    loaded << std::ifstream("/proc/self/maps").rdbuf();
    EXPECT_EQ(loaded.str().find(modules.string()), std::string::npos);
    EXPECT_EQ(QCoreApplication::libraryPaths(), with);
    QCoreApplication::setLibraryPaths(before);
}

TEST_F(BindDialogDescription, ReturnPairs) {
    press(Qt::Key_Return);
    EXPECT_EQ(clicks, Clicks{"okButton"});
}

TEST_F(BindDialogDescription, ReturnPairsAlsoFromTheListOfIdentities) {
    part<QComboBox>("identityPopup").setFocus();

    QTest::keyClick(&part<QComboBox>("identityPopup"), Qt::Key_Return);

    EXPECT_EQ(clicks, Clicks{"okButton"});
}

TEST_F(BindDialogDescription, EscapeCancels) {
    press(Qt::Key_Escape);

    EXPECT_EQ(clicks, Clicks{"cancelButton"});
    EXPECT_TRUE(bindDialog()->isVisible());
}

TEST_F(BindDialogDescription, KeysDoNothingWhileTheirButtonsAreDisabled) {
    for (auto* button : bindDialog()->findChildren<QPushButton*>()) button->setEnabled(false);

    press(Qt::Key_Return);
    press(Qt::Key_Escape);

    EXPECT_EQ(clicks, Clicks{});
}

TEST_F(BindDialogDescription, EachControlHasAnAccessKeyOfItsOwn) {
    std::set<std::string> keys;
    for (const char* button : {"okButton", "cancelButton", "dontShowAgainButton"})
        keys.insert(text(QKeySequence::mnemonic(part<QPushButton>(button).text()).toString()));
    keys.insert(text(QKeySequence::mnemonic(part<QLabel>("identityLabel").text()).toString()));

    EXPECT_EQ(keys.size(), 4U);
    EXPECT_FALSE(keys.contains(""));
    EXPECT_EQ(part<QLabel>("identityLabel").buddy(), &part<QComboBox>("identityPopup"));
}

TEST_F(BindDialogDescription, TheFocusGoesFromTheIdentitiesToTheButtons) {
    Clicks order;
    for (int i = 0; i < 4; ++i) {
        order.push_back(text(QApplication::focusWidget()->objectName()));
        QTest::keyClick(QApplication::focusWidget(), Qt::Key_Tab);
    }

    EXPECT_EQ(order, (Clicks{"identityPopup", "okButton", "cancelButton", "dontShowAgainButton"}));
}

TEST_F(BindDialogDescription, TellsAScreenReaderWhatItsPartsAre) {
    struct Row {
        const char* part;
        QAccessible::Role role;
        const char* name;
    };
    const Row rows[] = {
        {"identityPopup", QAccessible::ComboBox, "Alice"},
        {"okButton", QAccessible::Button, "Pair"},
        {"cancelButton", QAccessible::Button, "Cancel"},
        {"dontShowAgainButton", QAccessible::Button, "Do not show again"},
        {"messageLabel", QAccessible::StaticText, "Pair this smart card with your account?"},
    };
    for (const auto& row : rows) {
        auto* accessible = QAccessible::queryAccessibleInterface(&part<QWidget>(row.part));
        ASSERT_TRUE(accessible) << row.part;
        EXPECT_EQ(accessible->role(), row.role) << row.part;
        EXPECT_EQ(text(accessible->text(QAccessible::Name)), row.name);
    }
}

TEST_F(BindDialogDescription, TellsAScreenReaderWhatTheListIsCalled) {
    auto* list = QAccessible::queryAccessibleInterface(&part<QComboBox>("identityPopup"));

    const auto labels = list->relations(QAccessible::Label);

    ASSERT_EQ(labels.size(), 1);
    EXPECT_EQ(labels[0].first->object(), &part<QLabel>("identityLabel"));
    EXPECT_NE(text(list->text(QAccessible::Description)), "");
}

TEST_F(BindDialogDescription, FloatsAboveOrdinaryWindows) {
    EXPECT_FALSE(bindDialog()->windowFlags() & Qt::WindowStaysOnTopHint);

    window->setLevel(999);

    EXPECT_TRUE(bindDialog()->windowFlags() & Qt::WindowStaysOnTopHint);
    EXPECT_TRUE(bindDialog()->isVisible());
}

TEST_F(BindDialogDescription, IsInTheMiddleOfTheScreen) {
    window->centre();

    const QPoint off = bindDialog()->frameGeometry().center() -
                       bindDialog()->screen()->availableGeometry().center();
    EXPECT_LE(off.manhattanLength(), 2);
}

TEST_F(BindDialogDescription, IsAsLargeAsItsTextsNeed) {
    window->centre();

    const auto& information = part<QLabel>("informationLabel");
    EXPECT_GE(information.height(), information.heightForWidth(information.width()));
}

TEST_F(BindDialogDescription, ShowsALockWithTheBadgeInItsCorner) {
    auto& icon = part<QLabel>("iconView");
    window->makeKeyAndOrderFront();
    const auto lockWith = [&](const char* badge) {
        icon.clear();
        window->iconView("iconView")->showSecurityLock(badge, 32);
        EXPECT_TRUE(icon.pixmap().isNull()) << "it waits until the window is painted";
        EXPECT_TRUE(QTest::qWaitFor([&] { return !icon.pixmap().isNull(); }));
        return icon.pixmap().toImage();
    };
    const QImage without = lockWith("NoSuchPicture");
    const QImage with = lockWith("AppIcon");

    ASSERT_EQ(with.size(), QSize(64, 64));
    EXPECT_NE(without.pixelColor(32, 30).alpha(), 0) << "there is no lock";
    EXPECT_NE(with.copy(32, 32, 32, 32), without.copy(32, 32, 32, 32)) << "there is no badge";
    EXPECT_EQ(with.copy(0, 0, 64, 32), without.copy(0, 0, 64, 32));
}

TEST_F(BindDialogDescription, ASheetIsModalToTheWindowAndEndsWithEscapeToo) {
    int dismissals = 0;
    window->showSheet({platform::AlertStyle::Critical, "Failed", "Because", "OK"},
                      [&] { ++dismissals; });

    ASSERT_TRUE(sheet());
    EXPECT_EQ(sheet()->windowModality(), Qt::WindowModal);
    EXPECT_EQ(sheet()->parentWidget(), bindDialog());
    EXPECT_EQ(sheet()->icon(), QMessageBox::Critical);
    EXPECT_EQ(text(sheet()->text()), "Failed");
    EXPECT_EQ(text(sheet()->informativeText()), "Because");
    EXPECT_EQ(text(sheet()->defaultButton()->text()), "OK");

    QTest::keyClick(sheet(), Qt::Key_Escape);
    EXPECT_EQ(dismissals, 1);
    EXPECT_EQ(sheet(), nullptr);
}

TEST_F(BindDialogDescription, ASheetWithoutInformationHasNone) {
    window->showSheet({platform::AlertStyle::Critical, "Failed", "", "OK"}, [] {});

    ASSERT_TRUE(sheet());
    EXPECT_EQ(text(sheet()->informativeText()), "");
}

}  // namespace
}  // namespace vlm::test
