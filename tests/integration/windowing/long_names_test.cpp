// Names that are longer than the window: cut there, and read whole elsewhere.

#include <gtest/gtest.h>

#include <QAbstractItemView>
#include <QComboBox>
#include <QScreen>
#include <QTest>

#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

class LongNames : public ::testing::Test {
protected:
    void SetUp() override {
        window = windowingOnScreen().loadWindow("BindDialog");
        ASSERT_TRUE(window);
    }
    void TearDown() override {
        box().hidePopup();
        window.reset();
        settle();
    }

    void open(const std::string& title) {
        window->popUpButton("identityPopup")->append({"Alice", platform::Bytes{1}, false});
        window->popUpButton("identityPopup")->append({title, platform::Bytes{2}, false});
        window->centre();
        window->makeKeyAndOrderFront();
        box().showPopup();
        ASSERT_TRUE(QTest::qWaitForWindowExposed(box().view()->window()));
    }

    static QComboBox& box() { return part<QComboBox>("identityPopup"); }
    static QRect list() { return box().view()->window()->frameGeometry(); }
    static QRect button() { return {box().mapToGlobal(QPoint()), box().size()}; }
    static QRect screen() { return box().screen()->availableGeometry(); }

    std::unique_ptr<platform::Window> window;
};

TEST_F(LongNames, AreWholeInTheOpenedList) {
    const std::string title(
        static_cast<std::size_t>(screen().width() * 3 / 4) /
            static_cast<std::size_t>(box().fontMetrics().horizontalAdvance('n')),
        'n');
    open(title);

    const int needed = box().fontMetrics().horizontalAdvance(QString::fromStdString(title));
    EXPECT_GT(needed, box().width()) << "the window is wide enough for it";
    EXPECT_GE(box().view()->viewport()->width(), needed);
    EXPECT_TRUE(screen().contains(list()));
}

TEST_F(LongNames, MakeNoListThatIsWiderThanTheScreen) {
    for (const auto direction : {Qt::LeftToRight, Qt::RightToLeft}) {
        bindDialog()->setLayoutDirection(direction);
        open(std::string(256, 'W'));
        EXPECT_LE(list().width(), screen().width()) << direction;
        EXPECT_GE(list().left(), screen().left()) << direction;
        box().hidePopup();
    }
}

TEST_F(LongNames, LetTheListBeginWhereTheButtonDoes) {
    bindDialog()->setLayoutDirection(Qt::LeftToRight);
    open("Bob");
    EXPECT_EQ(list().left(), button().left());
    box().hidePopup();

    bindDialog()->setLayoutDirection(Qt::RightToLeft);
    open("Carol");
    EXPECT_EQ(list().right(), button().right());
}

TEST_F(LongNames, AreToldWholeForEachItemOfTheList) {
    open("<b>" + std::string(256, 'W'));

    EXPECT_EQ(box().itemData(1, Qt::ToolTipRole).toString().toStdString(),
              "<span>&lt;b&gt;" + std::string(256, 'W') + "</span>");
}

}  // namespace
}  // namespace vlm::test
