#include "platform/linux/qt/qt_window.h"

#include <QAbstractButton>
#include <QLayout>
#include <QScreen>
#include <algorithm>

#include "platform/linux/qt/qt_sheet.h"
#include "platform/linux/qt/text.h"

namespace vlm::platform::qt {

namespace {

// As wide as its parts want to be, and then as high as its lines of text need. The toolkit's own
// way takes the height for one width and then another width.
void fit(QWidget& dialog, int widest) {
    const QSize wanted = dialog.sizeHint();
    const int width = std::min(wanted.width(), widest);
    const int height = dialog.layout() ? dialog.layout()->totalHeightForWidth(width) : -1;
    dialog.resize(width, height < 0 ? wanted.height() : height);
}

}  // namespace

QtWindow::~QtWindow() {
    close();
    _dialog->deleteLater();
}

View* QtWindow::view(QWidget* widget) {
    auto& view = _views[widget];
    if (!view)
        view = std::make_unique<QtView>(widget, [this](QWidget* of) { return this->view(of); });
    return view.get();
}

PopUpButton* QtWindow::popUpButton(std::string_view name) {
    auto* box = _dialog->findChild<QComboBox*>(qt::name(name));
    if (!box) return nullptr;
    auto& button = _popUps[std::string(name)];
    if (!button) button = std::make_unique<QtPopUpButton>(box);
    return button.get();
}

IconView* QtWindow::iconView(std::string_view name) {
    auto* label = _dialog->findChild<QLabel*>(qt::name(name));
    if (!label || !isForPicture(*label)) return nullptr;
    auto& icon = _icons[std::string(name)];
    if (!icon) icon = std::make_unique<QtIconView>(label);
    return icon.get();
}

TextLabel* QtWindow::textLabel(std::string_view name) {
    const auto* label = _dialog->findChild<QLabel*>(qt::name(name));
    if (!label || isForPicture(*label)) return nullptr;
    auto& text = _labels[std::string(name)];
    if (!text) text = std::make_unique<TextLabel>();
    return text.get();
}

bool QtWindow::isForPicture(const QLabel& label) { return label.property("showsPicture").toBool(); }

void QtWindow::onClick(std::string_view button, std::function<void()> action) {
    auto* found = _dialog->findChild<QAbstractButton*>(name(button));
    if (!found) return;
    QObject::disconnect(found, &QAbstractButton::clicked, _dialog, nullptr);
    QObject::connect(found, &QAbstractButton::clicked, _dialog, std::move(action));
}

// The toolkit knows two levels only.
void QtWindow::setLevel(int level) {
    const bool wasVisible = _dialog->isVisible();
    _dialog->setWindowFlag(Qt::WindowStaysOnTopHint, level > 0);
    _dialog->setVisible(wasVisible);  // changing the flag hides it
}

void QtWindow::centre() {
    const QRect screen = _dialog->screen()->availableGeometry();
    fit(*_dialog, screen.width());
    QRect frame = _dialog->frameGeometry();
    frame.moveCenter(screen.center());
    _dialog->move(frame.topLeft());
}

void QtWindow::makeKeyAndOrderFront() {
    if (_isClosed) return;
    _dialog->show();
    _dialog->raise();
    _dialog->activateWindow();
}

void QtWindow::showSheet(const Alert& alert, std::function<void()> dismissed) {
    if (_isClosed) return;
    _sheets.emplace_back(openSheet(_dialog, alert, std::move(dismissed)));
}

void QtWindow::close() {
    _isClosed = true;
    for (const auto& sheet : _sheets) {
        if (!sheet) continue;
        QObject::disconnect(sheet, nullptr, _dialog, nullptr);
        sheet->close();
    }
    for (auto* button : _dialog->findChildren<QAbstractButton*>())
        QObject::disconnect(button, nullptr, _dialog, nullptr);
    _dialog->hide();
}

}  // namespace vlm::platform::qt
