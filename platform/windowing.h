// Windowing: the desktop's toolkit, in the words of this program.
//
// A window is loaded by the name of its description, which says how it looks; the program reaches
// parts of it by the names that they have there. Views form a tree; a control is a view that can be
// disabled.
//
// Ownership: a window belongs to whoever loaded it, and its views to the window. It may be let go
//            at any time, also from within what it calls; it calls nothing after that.
// Threads:   the main queue's only.
// Blocking:  loading a window may load the toolkit; nothing else does. A sheet is answered later.
// Errors:    a window that cannot be loaded is null, and the reason is in the log. A name that a
//            description does not hold gives null.
// Behind it: platform/linux/qt/
// In tests:  tests/fakes/fake_windowing.h, tests/contracts/windowing_contract.h

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/types.h"

namespace vlm::platform {

class Control {
public:
    virtual ~Control() = default;

    virtual bool isEnabled() const = 0;
    virtual void setEnabled(bool enabled) = 0;
};

class View {
public:
    virtual ~View() = default;

    // In the window's own order.
    virtual std::vector<View*> subviews() = 0;

    // This view as something that can be disabled; null when it cannot.
    virtual Control* control() = 0;
};

// An entry of a pop-up button. A separator has no title.
struct MenuItem {
    std::string title;
    std::optional<Bytes> object;  // what choosing it means
    bool isSeparator = false;
};

class PopUpButton {
public:
    virtual ~PopUpButton() = default;

    virtual void removeAllItems() = 0;
    // The first item that is appended to an empty pop-up becomes the selected one.
    virtual void append(const MenuItem& item) = 0;
    // None when there is no item.
    virtual std::optional<MenuItem> selectedItem() const = 0;
};

class IconView {
public:
    virtual ~IconView() = default;

    // The desktop's own picture of a lock, with the program's image in its corner, of this many
    // points in width and height.
    virtual void showSecurityLock(std::string_view badgeImage, int badgePoints) = 0;
};

class TextLabel {
public:
    virtual ~TextLabel() = default;
};

enum class AlertStyle { Informational, Warning, Critical };

struct Alert {
    AlertStyle style = AlertStyle::Critical;
    std::string message;
    std::string information;  // empty for none
    std::string button;
};

class Window {
public:
    virtual ~Window() = default;

    // Parts of the window by their names.
    virtual View& contentView() = 0;
    virtual PopUpButton* popUpButton(std::string_view name) = 0;
    virtual IconView* iconView(std::string_view name) = 0;
    virtual TextLabel* textLabel(std::string_view name) = 0;

    // Called for each click on the button of this name. The window's own close button clicks the
    // one that the description names for it.
    virtual void onClick(std::string_view button, std::function<void()> action) = 0;

    // Higher levels float above lower ones; ordinary windows have level 0.
    virtual void setLevel(int level) = 0;
    virtual void centre() = 0;
    virtual void makeKeyAndOrderFront() = 0;

    // Shows it as a sheet on this window, and calls once it was dismissed.
    virtual void showSheet(const Alert& alert, std::function<void()> dismissed) = 0;

    // Hides the window for good, without a click on any button. Sheets on it go too, and are not
    // dismissed. Closing again changes nothing.
    virtual void close() = 0;
};

class Windowing {
public:
    virtual ~Windowing() = default;

    virtual std::unique_ptr<Window> loadWindow(std::string_view description) = 0;

    // Takes the keyboard's focus for this program, also from another one.
    virtual void activateIgnoringOthers() = 0;
};

}  // namespace vlm::platform
