// DialogWindow: the toolkit's dialog, except that a person's wish to close it (Escape, the window's
// own close button) is a click on the button that the description's property "closeButton" names.

#pragma once

#include <QDialog>

namespace vlm::platform::qt {

class DialogWindow final : public QDialog {
public:
    using QDialog::QDialog;

    void reject() override;
};

}  // namespace vlm::platform::qt
