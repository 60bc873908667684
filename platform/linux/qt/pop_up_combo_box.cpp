#include "platform/linux/qt/pop_up_combo_box.h"

#include <QAbstractItemView>
#include <QHelpEvent>
#include <QScreen>
#include <QStylePainter>
#include <QToolTip>
#include <algorithm>

namespace vlm::platform::qt {

namespace {

// In characters of average width.
constexpr int kNarrowest = 24;
constexpr int kWidest = 84;

}  // namespace

PopUpComboBox::PopUpComboBox(QWidget* parent) : QComboBox(parent) {
    setSizeAdjustPolicy(AdjustToContents);
    view()->setTextElideMode(Qt::ElideMiddle);
}

QSize PopUpComboBox::sizeHint() const {
    const QSize whole = QComboBox::sizeHint();
    const int character = fontMetrics().averageCharWidth();
    return {std::clamp(whole.width(), kNarrowest * character, kWidest * character), whole.height()};
}

QSize PopUpComboBox::minimumSizeHint() const {
    return {kNarrowest * fontMetrics().averageCharWidth(), QComboBox::minimumSizeHint().height()};
}

// The list may be wider than the button, but not than the screen.
void PopUpComboBox::showPopup() {
    const int margins = 4 * fontMetrics().height();
    const int wanted = view()->sizeHintForColumn(0) + margins;
    view()->setMinimumWidth(std::min(wanted, screen()->availableGeometry().width() / 2));
    QComboBox::showPopup();
}

// A tool tip interprets what looks like markup, and so gets titles in markup.
bool PopUpComboBox::event(QEvent* event) {
    if (event->type() != QEvent::ToolTip) return QComboBox::event(event);
    const bool isWhole = elidedTitle() == currentText();
    const auto* help = static_cast<QHelpEvent*>(event);
    const QString whole = "<span>" + currentText().toHtmlEscaped() + "</span>";
    QToolTip::showText(help->globalPos(), isWhole ? QString() : whole, this);
    return true;
}

void PopUpComboBox::paintEvent(QPaintEvent*) {
    QStylePainter painter(this);
    QStyleOptionComboBox option;
    initStyleOption(&option);
    option.currentText = elidedTitle();
    painter.drawComplexControl(QStyle::CC_ComboBox, option);
    painter.drawControl(QStyle::CE_ComboBoxLabel, option);
}

QString PopUpComboBox::elidedTitle() const {
    return fontMetrics().elidedText(currentText(), Qt::ElideMiddle, textWidth());
}

int PopUpComboBox::textWidth() const {
    QStyleOptionComboBox option;
    initStyleOption(&option);
    const QRect field =
        style()->subControlRect(QStyle::CC_ComboBox, &option, QStyle::SC_ComboBoxEditField, this);
    return field.width() - fontMetrics().averageCharWidth();
}

}  // namespace vlm::platform::qt
