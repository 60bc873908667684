#include "platform/linux/qt/installed_resources.h"

#include <QCoreApplication>

namespace vlm::platform::qt {

QString installedResource(const QString& kind, const QString& file) {
    if (file.startsWith('.') || file.contains('/')) return {};
    return QCoreApplication::applicationDirPath() + "/../share/vlm/" + kind + '/' + file;
}

}  // namespace vlm::platform::qt
