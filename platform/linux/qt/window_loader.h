// Window descriptions: resources/ui/NAME.ui, read when a window is loaded.

#pragma once

#include <QStringList>
#include <QUiLoader>
#include <memory>
#include <string_view>

#include "platform/linux/qt/dialog_window.h"

namespace vlm::platform::qt {

// While this is there, the toolkit finds no modules that it does not have yet.
class HiddenModules {
public:
    HiddenModules();
    ~HiddenModules();
    HiddenModules(const HiddenModules&) = delete;
    HiddenModules& operator=(const HiddenModules&) = delete;

private:
    const QStringList _folders;
};

// Makes the widgets of a description, ours where ours are better. There are none of other makers: a
// loader would load every module of widgets, from folders of the environment too, when it is made.
class WindowLoader final : private HiddenModules, private QUiLoader {
public:
    // Null when there is no such description; the log says why.
    std::unique_ptr<DialogWindow> load(std::string_view description);

private:
    QWidget* createWidget(const QString& className, QWidget* parent, const QString& name) override;
};

}  // namespace vlm::platform::qt
