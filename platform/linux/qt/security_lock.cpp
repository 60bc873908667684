#include "platform/linux/qt/security_lock.h"

#include <QIcon>
#include <QPainter>
#include <QPainterPath>

namespace vlm::platform::qt {

namespace {

const QColor kBody("#e5a50a");
const QColor kBodyEdge("#986a00");
const QColor kShackle("#8e9299");
const QColor kKeyhole("#5e3c00");

// In a square of 64.
void drawLock(QPainter& painter) {
    QPainterPath shackle;
    shackle.moveTo(19, 32);
    shackle.lineTo(19, 22);
    shackle.arcTo(QRectF(19, 9, 26, 26), 180, -180);
    shackle.lineTo(45, 32);
    painter.setBrush(Qt::NoBrush);
    painter.setPen(QPen(kShackle, 6, Qt::SolidLine, Qt::FlatCap));
    painter.drawPath(shackle);

    QLinearGradient body(0, 28, 0, 58);
    body.setColorAt(0, kBody.lighter(125));
    body.setColorAt(1, kBody);
    painter.setPen(QPen(kBodyEdge, 1.5));
    painter.setBrush(body);
    painter.drawRoundedRect(QRectF(11, 28, 42, 30), 5, 5);

    painter.setPen(Qt::NoPen);
    painter.setBrush(kKeyhole);
    painter.drawEllipse(QPointF(32, 40), 4, 4);
    painter.drawRoundedRect(QRectF(30, 41, 4, 10), 2, 2);
}

}  // namespace

QPixmap securityLock(int points, qreal pixelRatio) {
    for (const char* name : {"system-lock-screen", "dialog-password", "security-high"}) {
        const QIcon icon = QIcon::fromTheme(name);
        QPixmap picture = icon.pixmap(QSize(points, points), pixelRatio);
        // A theme may have the picture for menus only, which is nothing to look at in this size.
        if (picture.deviceIndependentSize().width() >= points) return picture;
    }
    QPixmap drawn((QSizeF(points, points) * pixelRatio).toSize());
    drawn.setDevicePixelRatio(pixelRatio);
    drawn.fill(Qt::transparent);
    QPainter painter(&drawn);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.scale(points / 64.0, points / 64.0);
    drawLock(painter);
    return drawn;
}

}  // namespace vlm::platform::qt
