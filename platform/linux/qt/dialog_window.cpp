#include "platform/linux/qt/dialog_window.h"

#include <QAbstractButton>
#include <QVariant>

namespace vlm::platform::qt {

// The window stays: whoever gets the click closes it, or does not.
void DialogWindow::reject() {
    const QString name = property("closeButton").toString();
    if (auto* button = findChild<QAbstractButton*>(name)) button->click();
}

}  // namespace vlm::platform::qt
