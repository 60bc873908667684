#include "platform/linux/qt/window_loader.h"

#include <QCoreApplication>
#include <QFile>

#include "platform/linux/qt/installed_resources.h"
#include "platform/linux/qt/pop_up_combo_box.h"
#include "platform/linux/qt/text.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform::qt {

namespace {

constexpr Log kLog(kTokenFramework, "windowing");

}  // namespace

HiddenModules::HiddenModules() : _folders(QCoreApplication::libraryPaths()) {
    QCoreApplication::setLibraryPaths({});
}

HiddenModules::~HiddenModules() { QCoreApplication::setLibraryPaths(_folders); }

std::unique_ptr<DialogWindow> WindowLoader::load(std::string_view description) {
    const auto complain = [&](const QString& reason) {
        kLog.error("loading the window {}: {}", std::string(description), reason.toStdString());
        return nullptr;
    };
    QFile file(installedResource("ui", name(description) + ".ui"));
    if (!file.open(QIODevice::ReadOnly)) return complain(file.errorString());
    std::unique_ptr<QWidget> widget(QUiLoader::load(&file));
    if (!widget) return complain(errorString());
    auto* dialog = dynamic_cast<DialogWindow*>(widget.get());
    if (!dialog) return complain("it describes no dialog");
    static_cast<void>(widget.release());
    return std::unique_ptr<DialogWindow>(dialog);
}

QWidget* WindowLoader::createWidget(const QString& className, QWidget* parent,
                                    const QString& name) {
    QWidget* widget = nullptr;
    if (className == "QDialog")
        widget = new DialogWindow(parent);
    else if (className == "QComboBox")
        widget = new PopUpComboBox(parent);
    else
        return QUiLoader::createWidget(className, parent, name);
    widget->setObjectName(name);
    return widget;
}

}  // namespace vlm::platform::qt
