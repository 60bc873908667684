// The picture of a lock: the desktop's own, else one drawn here.

#pragma once

#include <QPixmap>

namespace vlm::platform::qt {

// Of this many points in width and height, for a screen with that many pixels in a point.
QPixmap securityLock(int points, qreal pixelRatio);

}  // namespace vlm::platform::qt
