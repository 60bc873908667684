#include "tests/integration/windowing/screen.h"

#include <QApplication>
#include <QPushButton>
#include <QTest>
#include <cstdlib>

#include "platform/platform.h"

namespace vlm::test {

platform::Windowing& windowingOnScreen() {
    setenv("QT_QPA_PLATFORM", "offscreen", 1);
    setenv("LC_ALL", "C.UTF-8", 1);
    setenv("LANGUAGE", "en", 1);
    return platform::current().windowing();
}

QDialog* bindDialog() {
    if (!qApp) return nullptr;
    QDialog* last = nullptr;
    for (auto* widget : QApplication::topLevelWidgets())
        if (widget->objectName() == "BindDialog") last = qobject_cast<QDialog*>(widget);
    return last;
}

QMessageBox* sheet() {
    if (!qApp) return nullptr;
    for (auto* widget : QApplication::topLevelWidgets())
        if (auto* box = qobject_cast<QMessageBox*>(widget); box && box->isVisible()) return box;
    return nullptr;
}

void click(const std::string& button) {
    QTest::mouseClick(&part<QPushButton>(button.c_str()), Qt::LeftButton);
}

void press(Qt::Key key) { QTest::keyClick(bindDialog(), key); }

void settle() {
    if (!qApp) return;
    QCoreApplication::sendPostedEvents();
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    QCoreApplication::processEvents();
}

}  // namespace vlm::test
