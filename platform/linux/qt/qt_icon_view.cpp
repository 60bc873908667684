#include "platform/linux/qt/qt_icon_view.h"

#include <QEvent>
#include <QIcon>
#include <QPainter>
#include <QTimer>
#include <functional>
#include <utility>

#include "platform/linux/qt/installed_resources.h"
#include "platform/linux/qt/security_lock.h"
#include "platform/linux/qt/text.h"

namespace vlm::platform::qt {

namespace {

constexpr int kPoints = 64;

// Calls once, when the widget has been painted.
class AfterPainting final : public QObject {
public:
    AfterPainting(QWidget& widget, std::function<void()> call)
        : QObject(&widget), _call(std::move(call)) {
        widget.installEventFilter(this);
    }

    bool eventFilter(QObject* widget, QEvent* event) override {
        if (event->type() != QEvent::Paint) return false;
        widget->removeEventFilter(this);
        QTimer::singleShot(0, this, [this] {
            _call();
            deleteLater();
        });
        return false;
    }

private:
    const std::function<void()> _call;
};

void draw(QLabel& label, const QString& badgeFile, int badgePoints) {
    const qreal ratio = label.devicePixelRatioF();
    QPixmap picture = securityLock(kPoints, ratio);
    const QIcon badge(badgeFile);
    const QRect corner(kPoints - badgePoints, kPoints - badgePoints, badgePoints, badgePoints);
    QPainter painter(&picture);
    painter.drawPixmap(corner, badge.pixmap(corner.size(), ratio));
    painter.end();
    label.setPixmap(picture);
    label.window()->setWindowIcon(badge);
}

}  // namespace

// To look through a theme and to draw from a description takes a good part of what a window takes,
// so the picture comes a moment after the words.
void QtIconView::showSecurityLock(std::string_view badgeImage, int badgePoints) {
    _label->setFixedSize(kPoints, kPoints);
    const QString badge = installedResource("icons", name(badgeImage) + ".svg");
    new AfterPainting(*_label,
                      [label = _label, badge, badgePoints] { draw(*label, badge, badgePoints); });
    _label->update();
}

}  // namespace vlm::platform::qt
