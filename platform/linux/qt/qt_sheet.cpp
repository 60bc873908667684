#include "platform/linux/qt/qt_sheet.h"

#include <QLabel>
#include <QPushButton>

#include "platform/linux/qt/text.h"

namespace vlm::platform::qt {

namespace {

QMessageBox::Icon iconOf(AlertStyle style) {
    switch (style) {
        case AlertStyle::Informational:
            return QMessageBox::Information;
        case AlertStyle::Warning:
            return QMessageBox::Warning;
        case AlertStyle::Critical:
            return QMessageBox::Critical;
    }
    return QMessageBox::NoIcon;
}

constexpr int kNarrowestText = 280;  // points

// The message is the title of what is explained below it.
void showAsTitle(QMessageBox& box) {
    auto* message = box.findChild<QLabel*>("qt_msgbox_label");
    if (!message) return;
    QFont font = message->font();
    font.setBold(true);
    message->setFont(font);
    message->setMinimumWidth(kNarrowestText);
}

// Its labels would take an error text that looks like markup for markup, and open its links.
void showPlainTextOnly(QMessageBox& box) {
    for (auto* label : box.findChildren<QLabel*>()) {
        label->setTextFormat(Qt::PlainText);
        label->setOpenExternalLinks(false);
    }
}

}  // namespace

QMessageBox* openSheet(QWidget* parent, const Alert& alert, std::function<void()> dismissed) {
    auto* box = new QMessageBox(iconOf(alert.style), parent->windowTitle(),
                                shownText(alert.message), QMessageBox::NoButton, parent);
    if (!alert.information.empty()) box->setInformativeText(shownText(alert.information));
    showPlainTextOnly(*box);
    showAsTitle(*box);
    auto* button = box->addButton(shownText(alert.button), QMessageBox::AcceptRole);
    box->setDefaultButton(button);
    box->setEscapeButton(button);
    box->setWindowModality(Qt::WindowModal);
    box->setAttribute(Qt::WA_DeleteOnClose);
    QObject::connect(box, &QMessageBox::finished, parent, std::move(dismissed));
    box->show();
    return box;
}

}  // namespace vlm::platform::qt
