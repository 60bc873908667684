// QtPopUpButton: a combo box as a pop-up button.

#pragma once

#include <QComboBox>

#include "platform/windowing.h"

namespace vlm::platform::qt {

class QtPopUpButton final : public PopUpButton {
public:
    explicit QtPopUpButton(QComboBox* box) : _box(box) {}

    void removeAllItems() override;
    void append(const MenuItem& item) override;
    std::optional<MenuItem> selectedItem() const override;

private:
    void addTitle(const QString& title);

    QComboBox* const _box;
    std::vector<MenuItem> _items;  // as they came, in the box's order
};

}  // namespace vlm::platform::qt
