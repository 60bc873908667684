// QtIconView: a label that shows a picture.

#pragma once

#include <QLabel>

#include "platform/windowing.h"

namespace vlm::platform::qt {

class QtIconView final : public IconView {
public:
    explicit QtIconView(QLabel* label) : _label(label) {}

    void showSecurityLock(std::string_view badgeImage, int badgePoints) override;

private:
    QLabel* const _label;
};

}  // namespace vlm::platform::qt
