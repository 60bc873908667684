// Window descriptions: resources/ui/NAME.ui, read when a window is loaded.

#pragma once

#include <QUiLoader>
#include <memory>
#include <string_view>

#include "platform/linux/qt/dialog_window.h"

namespace vlm::platform::qt {

// Makes the widgets of a description, ours where ours are better.
class WindowLoader final : private QUiLoader {
public:
    WindowLoader();

    // Null when there is no such description; the log says why.
    std::unique_ptr<DialogWindow> load(std::string_view description);

private:
    QWidget* createWidget(const QString& className, QWidget* parent, const QString& name) override;
};

}  // namespace vlm::platform::qt
