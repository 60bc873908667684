// QtView: a widget of a window as a view.
//
// Ownership: the widget belongs to the window, which keeps one view for each.

#pragma once

#include <QWidget>
#include <functional>

#include "platform/windowing.h"

namespace vlm::platform::qt {

class QtView final : public View, private Control {
public:
    // The one view of a widget.
    using Views = std::function<View*(QWidget*)>;

    QtView(QWidget* widget, Views views) : _widget(widget), _views(std::move(views)) {}

    // Those that the description names; not the parts that the toolkit makes its widgets of.
    std::vector<View*> subviews() override;

    // Whatever a person can use; null for what is only looked at.
    Control* control() override;

private:
    bool isEnabled() const override { return _widget->isEnabled(); }
    void setEnabled(bool enabled) override { _widget->setEnabled(enabled); }

    QWidget* const _widget;
    const Views _views;
};

}  // namespace vlm::platform::qt
