#include <QSocketNotifier>

#include "platform/export.h"
#include "platform/linux/qt/qt_windowing.h"
#include "platform/linux/windowing_module.h"

using vlm::platform::qt::QtWindowing;

namespace {

QtWindowing& windowing() {
    static auto& service = *new QtWindowing;
    return service;
}

}  // namespace

extern "C" VLM_EXPORT vlm::platform::Windowing* vlmWindowing() { return &windowing(); }

extern "C" VLM_EXPORT int vlmRunLoop(int wakeDescriptor, void (*dispatch)(void*), void* context) {
    if (!windowing().start()) return -1;
    QSocketNotifier wake(wakeDescriptor, QSocketNotifier::Read);
    QObject::connect(&wake, &QSocketNotifier::activated, [&] { dispatch(context); });
    return QCoreApplication::exec();
}

extern "C" VLM_EXPORT void vlmEndLoop() { QCoreApplication::quit(); }
