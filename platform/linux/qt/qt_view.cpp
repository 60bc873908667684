#include "platform/linux/qt/qt_view.h"

#include <QAbstractButton>
#include <QComboBox>

namespace vlm::platform::qt {

std::vector<View*> QtView::subviews() {
    std::vector<View*> found;
    for (auto* part : _widget->findChildren<QWidget*>(QString(), Qt::FindDirectChildrenOnly)) {
        const QString name = part->objectName();
        const bool described = !name.isEmpty() && !name.startsWith("qt_") && !part->isWindow();
        if (described) found.push_back(_views(part));
    }
    return found;
}

Control* QtView::control() {
    const bool isUsed =
        qobject_cast<QAbstractButton*>(_widget) || qobject_cast<QComboBox*>(_widget);
    return isUsed ? this : nullptr;
}

}  // namespace vlm::platform::qt
