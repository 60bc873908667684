// Draws the pairing window into a PNG: window_picture FILE [dark] [long] [opened] [failed] [busy]
//
// dark: in dark colours; long: titles longer than the window; opened: with the list of identities
// open; failed: with the alert of a failed pairing; busy: while a card is at work.

#include <QApplication>
#include <QComboBox>
#include <QMessageBox>
#include <QPainter>
#include <QStyleFactory>
#include <algorithm>
#include <iostream>
#include <string>
#include <vector>

#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "ui/bind_dialog.h"

namespace vlm {
namespace {

using Words = std::vector<std::string>;

QPalette darkPalette() {
    QPalette palette(QColor("#2e3136"), QColor("#26292d"));
    for (const auto role : {QPalette::WindowText, QPalette::Text, QPalette::ButtonText,
                            QPalette::BrightText, QPalette::ToolTipText})
        palette.setColor(role, QColor("#eceff1"));
    for (const auto role : {QPalette::WindowText, QPalette::Text, QPalette::ButtonText})
        palette.setColor(QPalette::Disabled, role, QColor("#7d838a"));
    palette.setColor(QPalette::Base, QColor("#1d1f22"));
    palette.setColor(QPalette::Button, QColor("#3a3e44"));
    palette.setColor(QPalette::Highlight, QColor("#3d7bd9"));
    return palette;
}

BindOperation::UnpairedIdentities identities(bool areLong) {
    const std::string alice = areLong ? "Alexandra Wolkenstein-Rodriguez (Digital Signature, "
                                        "Example Certification Authority of the Northern Region)"
                                      : "Alice Example (Signature)";
    return {{"blue", {{{1}, alice}, {{2}, "Alice Example (Key Exchange)"}}},
            {"red", {{{3}, "Bob Example"}}}};
}

// The window with what is open above it: a sheet, or the list of identities.
QPixmap pictureOf(QWidget& window) {
    auto* list = QApplication::activePopupWidget();
    const QRect whole = list ? window.geometry() | list->geometry() : window.geometry();
    QPixmap picture(whole.size() * window.devicePixelRatioF());
    picture.setDevicePixelRatio(window.devicePixelRatioF());
    picture.fill(Qt::white);
    QPainter painter(&picture);
    painter.drawPixmap(window.geometry().topLeft() - whole.topLeft(), window.grab());
    if (list) painter.drawPixmap(list->geometry().topLeft() - whole.topLeft(), list->grab());
    for (auto* box : window.findChildren<QMessageBox*>()) {
        painter.fillRect(window.rect(), QColor(0, 0, 0, 110));
        painter.drawPixmap(window.rect().center() - box->rect().center(), box->grab());
    }
    return picture;
}

int draw(const std::string& file, const Words& words) {
    const auto wants = [&](const char* word) { return std::ranges::count(words, word) > 0; };
    const auto operation = BindOperation::initWithUserName("alice");
    operation->setUnpairedIdentities(identities(wants("long")));
    const auto dialog = BindDialog::initWithOperation(operation);
    dialog->showWindow();
    if (!dialog->window()) return 1;

    QApplication::setStyle(QStyleFactory::create("Fusion"));
    if (wants("dark")) QApplication::setPalette(darkPalette());
    if (wants("busy")) dialog->setEnabled(false);
    if (wants("failed")) {
        auto& texts = platform::current().localization();
        dialog->showAlert(
            {platform::AlertStyle::Critical, texts.text("PAIRING_FAILED"),
             platform::text(texts.text("PAIRING_ERROR"), texts.text("SC_IS_ALREADY_PAIRED")),
             texts.text("OK")},
            [] {});
    }
    dialog->window()->centre();
    QCoreApplication::processEvents();
    for (auto* window : QApplication::topLevelWidgets()) {
        if (window->objectName() != "BindDialog") continue;
        if (wants("opened")) window->findChild<QComboBox*>()->showPopup();
        return pictureOf(*window).save(QString::fromStdString(file), "PNG") ? 0 : 1;
    }
    return 1;
}

}  // namespace
}  // namespace vlm

int main(int argc, char* argv[]) {
    const vlm::Words words(argv + 1, argv + argc);
    if (words.empty()) {
        std::cerr << "usage: window_picture FILE [dark] [long] [opened] [failed] [busy]\n";
        return 2;
    }
    return vlm::draw(words.front(), words);
}
