#include "ui/window_controller.h"

#include "platform/platform.h"

namespace vlm {

platform::Window* WindowController::window() {
    if (_isClosed) return nullptr;
    if (!_window) {
        _window = platform::current().windowing().loadWindow(_windowDescription);
        if (!_window) return nullptr;
        connectOutlets(*_window);
        windowDidLoad();
    }
    return _window.get();
}

bool WindowController::showWindow() {
    auto* shown = window();
    if (shown) shown->makeKeyAndOrderFront();
    return shown != nullptr;
}

// The window stays until the controller goes: it may be the one who asks.
void WindowController::close() {
    _isClosed = true;
    if (_window) _window->close();
}

}  // namespace vlm
