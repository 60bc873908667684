#include "platform/linux/qt/qt_icon_view.h"

#include <QIcon>
#include <QPainter>

#include "platform/linux/qt/installed_resources.h"
#include "platform/linux/qt/security_lock.h"
#include "platform/linux/qt/text.h"

namespace vlm::platform::qt {

namespace {

constexpr int kPoints = 64;

}  // namespace

void QtIconView::showSecurityLock(std::string_view badgeImage, int badgePoints) {
    const qreal ratio = _label->devicePixelRatioF();
    QPixmap picture = securityLock(kPoints, ratio);
    const QIcon badge(installedResource("icons", name(badgeImage) + ".svg"));
    const QRect corner(kPoints - badgePoints, kPoints - badgePoints, badgePoints, badgePoints);
    QPainter painter(&picture);
    painter.drawPixmap(corner, badge.pixmap(corner.size(), ratio));
    painter.end();
    _label->setPixmap(picture);
    _label->window()->setWindowIcon(badge);
}

}  // namespace vlm::platform::qt
