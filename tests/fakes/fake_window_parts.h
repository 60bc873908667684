// What a window in memory is made of. A description adds parts to its tree; a test looks at them.

#pragma once

#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "platform/windowing.h"

namespace vlm::fakes {

// A view, which can be disabled when it is also a control.
class FakeView : public platform::View, private platform::Control {
public:
    enum class Kind { Plain, Control };

    explicit FakeView(std::string viewName, Kind kind = Kind::Plain)
        : name(std::move(viewName)), _kind(kind) {}

    template <typename Part = FakeView, typename... Arguments>
    Part& add(Arguments&&... arguments) {
        auto part = std::make_unique<Part>(std::forward<Arguments>(arguments)...);
        auto& added = *part;
        _parts.push_back(std::move(part));
        return added;
    }

    // This view or one below it; null when the tree has none of this kind and name.
    template <typename Part = FakeView>
    Part* find(std::string_view wanted) {
        if (name == wanted)
            if (auto* part = dynamic_cast<Part*>(this)) return part;
        for (const auto& part : _parts)
            if (auto* found = part->template find<Part>(wanted)) return found;
        return nullptr;
    }

    // View:
    std::vector<platform::View*> subviews() override {
        std::vector<platform::View*> views;
        for (const auto& part : _parts) views.push_back(part.get());
        return views;
    }
    platform::Control* control() override { return _kind == Kind::Control ? this : nullptr; }

    const std::string name;
    bool enabled = true;
    std::vector<bool> enablings;  // what setEnabled was called with, oldest first

private:
    // Control:
    bool isEnabled() const override { return enabled; }
    void setEnabled(bool now) override {
        enabled = now;
        enablings.push_back(now);
    }

    const Kind _kind;
    std::vector<std::unique_ptr<FakeView>> _parts;
};

class FakePopUpButton final : public FakeView, public platform::PopUpButton {
public:
    explicit FakePopUpButton(std::string viewName) : FakeView(std::move(viewName), Kind::Control) {}

    // What a person does.
    void choose(std::size_t index) { _selected = index; }

    // PopUpButton:
    void removeAllItems() override { items.clear(); }
    void append(const platform::MenuItem& item) override {
        if (items.empty()) _selected = 0;
        items.push_back(item);
    }
    std::optional<platform::MenuItem> selectedItem() const override {
        return items.empty() ? std::nullopt : std::optional(items.at(_selected));
    }

    std::vector<platform::MenuItem> items;

private:
    std::size_t _selected = 0;
};

class FakeIconView final : public FakeView, public platform::IconView {
public:
    using FakeView::FakeView;

    void showSecurityLock(std::string_view badgeImage, int badgePoints) override {
        badge = badgeImage;
        points = badgePoints;
    }

    std::string badge;
    int points = 0;
};

class FakeTextLabel final : public FakeView, public platform::TextLabel {
public:
    using FakeView::FakeView;
};

class FakeButton final : public FakeView {
public:
    explicit FakeButton(std::string viewName) : FakeView(std::move(viewName), Kind::Control) {}

    std::function<void()> action;
};

}  // namespace vlm::fakes
