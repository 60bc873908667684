// WindowController: one window, which is loaded when it is first needed.
//
// Ownership: owns the window. What the window calls must hold the controller weakly.
// Threads:   the main queue's only; it may be made on any thread.
// Blocking:  the first use loads the window.
// Errors:    without a window every call does nothing; the reason is in the log. It is tried again
//            with the next use.
// In tests:  tests/unit/ui/window_controller_test.cpp

#pragma once

#include <memory>
#include <string>

#include "platform/windowing.h"

namespace vlm {

class WindowController {
public:
    explicit WindowController(std::string windowDescription)
        : _windowDescription(std::move(windowDescription)) {}
    virtual ~WindowController() = default;
    WindowController(const WindowController&) = delete;
    WindowController& operator=(const WindowController&) = delete;

    // Loaded now if it was not yet; null when that fails, and after close().
    platform::Window* window();

    bool isWindowLoaded() const { return _window != nullptr; }

    // In front of the others, with the keyboard's focus; false when there is no window.
    bool showWindow();

    // For good.
    void close();

protected:
    // Called with the window, before anything is done to it: takes the parts that are needed later
    // and says what buttons do.
    virtual void connectOutlets(platform::Window& window) = 0;

    // Called once, after that.
    virtual void windowDidLoad() {}

private:
    const std::string _windowDescription;
    std::unique_ptr<platform::Window> _window;
    bool _isClosed = false;
};

}  // namespace vlm
