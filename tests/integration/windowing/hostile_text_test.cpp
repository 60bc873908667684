// Texts of a card are shown as they are: as text that does nothing.

#include <gtest/gtest.h>

#include <QComboBox>
#include <QHelpEvent>
#include <QLabel>
#include <QTest>
#include <QToolTip>

#include "tests/integration/windowing/screen.h"

namespace vlm::test {
namespace {

class HostileText : public ::testing::Test {
protected:
    void SetUp() override {
        window = windowingOnScreen().loadWindow("BindDialog");
        ASSERT_TRUE(window);
    }
    void TearDown() override {
        QToolTip::hideText();
        window.reset();
        settle();
    }

    void offer(const std::string& title) {
        window->popUpButton("identityPopup")->append({title, platform::Bytes{1}, false});
        window->centre();
        window->makeKeyAndOrderFront();
    }
    static QComboBox& box() { return part<QComboBox>("identityPopup"); }

    static std::string toolTip() {
        QHelpEvent asks(QEvent::ToolTip, QPoint(5, 5), box().mapToGlobal(QPoint(5, 5)));
        QCoreApplication::sendEvent(&box(), &asks);
        return QToolTip::text().toStdString();
    }

    std::unique_ptr<platform::Window> window;
};

TEST_F(HostileText, IsNoMarkupInTheListOfIdentities) {
    offer("<h1>Alice</h1><img src='file:///etc/passwd'> & &amp;");

    EXPECT_EQ(box().currentText().toStdString(),
              "<h1>Alice</h1><img src='file:///etc/passwd'> & &amp;");
}

TEST_F(HostileText, NeitherBreaksLinesNorTurnsThemAround) {
    offer(
        "Ali\nce \xE2\x80\xAE"
        "ecila \xE2\x81\xA7 \x1B[2J");

    EXPECT_EQ(box().currentText().toStdString(),
              "Ali\xEF\xBF\xBD"
              "ce \xEF\xBF\xBD"
              "ecila \xEF\xBF\xBD \xEF\xBF\xBD[2J");
}

TEST_F(HostileText, IsNoMarkupInAToolTip) {
    const std::string title = "<img src=x>" + std::string(200, 'W');
    offer(title);

    EXPECT_EQ(toolTip(), "<span>&lt;img src=x&gt;" + std::string(200, 'W') + "</span>");
}

TEST_F(HostileText, ThatIsLongLeavesTheWindowItsWidth) {
    offer(std::string(5000, 'W'));

    EXPECT_LT(bindDialog()->width(), 1000);
    const auto& information = part<QLabel>("informationLabel");
    EXPECT_GE(information.height(), information.heightForWidth(information.width()));
}

TEST_F(HostileText, ATitleThatFitsNeedsNoToolTip) {
    offer("Alice");

    EXPECT_EQ(toolTip(), "");
}

TEST_F(HostileText, NoLabelOfTheWindowTakesMarkup) {
    const auto labels = bindDialog()->findChildren<QLabel*>();

    EXPECT_GE(labels.size(), 4);
    for (const auto* label : labels)
        EXPECT_EQ(label->textFormat(), Qt::PlainText) << label->objectName().toStdString();
}

TEST_F(HostileText, NoLabelOfASheetTakesMarkup) {
    window->makeKeyAndOrderFront();
    window->showSheet({platform::AlertStyle::Critical, "<h1>Failed</h1>",
                       "<a href='https://example.org/'>\xE2\x80\xAEhere</a>", "<b>OK</b>"},
                      [] {});

    ASSERT_TRUE(sheet());
    int texts = 0;
    for (const auto* label : sheet()->findChildren<QLabel*>()) {
        EXPECT_EQ(label->textFormat(), Qt::PlainText) << label->objectName().toStdString();
        EXPECT_FALSE(label->openExternalLinks());
        texts += label->text().startsWith('<') ? 1 : 0;
    }
    EXPECT_EQ(texts, 2);
    EXPECT_EQ(sheet()->informativeText().toStdString(),
              "<a href='https://example.org/'>\xEF\xBF\xBDhere</a>");
}

}  // namespace
}  // namespace vlm::test
