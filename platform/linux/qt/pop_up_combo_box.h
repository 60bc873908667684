// PopUpComboBox: the toolkit's combo box for titles that may be long. It grows with them up to a
// limit; what is longer is cut in the middle, where names differ least, and read whole in the list
// and in the tool tip.

#pragma once

#include <QComboBox>

namespace vlm::platform::qt {

class PopUpComboBox final : public QComboBox {
public:
    explicit PopUpComboBox(QWidget* parent);

    QSize sizeHint() const override;
    QSize minimumSizeHint() const override;
    void showPopup() override;

protected:
    bool event(QEvent* event) override;
    void paintEvent(QPaintEvent* event) override;

private:
    // The current title as it fits.
    QString elidedTitle() const;
    int textWidth() const;
};

}  // namespace vlm::platform::qt
