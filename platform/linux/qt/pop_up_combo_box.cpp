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

// Keep the direction of the window from what is inside: a bracket that lost its partner would go to
// the other end of a name.
constexpr QChar kIsolate(0x2068);
constexpr QChar kEndOfIsolate(0x2069);

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

// The list may be wider than the button, but not than the screen. It begins where the button does,
// unless it would reach over the edge.
void PopUpComboBox::showPopup() {
    const QRect available = screen()->availableGeometry();
    const int margins = 4 * fontMetrics().height();
    const int wanted = view()->sizeHintForColumn(0) + margins;
    view()->setMinimumWidth(std::min(wanted, available.width() - margins));
    QComboBox::showPopup();

    QWidget& list = *view()->window();
    const QRect button(mapToGlobal(QPoint()), size());
    const int begin = isRightToLeft() ? button.right() + 1 - list.width() : button.left();
    const int furthest = std::max(available.left(), available.right() + 1 - list.width());
    list.move(std::clamp(begin, available.left(), furthest), list.y());
}

bool PopUpComboBox::event(QEvent* event) {
    if (event->type() != QEvent::ToolTip) return QComboBox::event(event);
    const bool isWhole = elidedTitle() == currentText();
    const auto* help = static_cast<QHelpEvent*>(event);
    const QString whole = currentData(Qt::ToolTipRole).toString();
    QToolTip::showText(help->globalPos(), isWhole ? QString() : whole, this);
    return true;
}

void PopUpComboBox::paintEvent(QPaintEvent*) {
    QStylePainter painter(this);
    QStyleOptionComboBox option;
    initStyleOption(&option);
    option.currentText = kIsolate + elidedTitle() + kEndOfIsolate;
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
