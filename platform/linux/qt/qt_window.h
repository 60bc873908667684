// QtWindow: a dialog of the toolkit as a window.
//
// It may be let go from within what it calls, so its widgets go when the toolkit's loop is next
// run.

#pragma once

#include <QPointer>
#include <map>
#include <memory>
#include <string>

#include "platform/linux/qt/dialog_window.h"
#include "platform/linux/qt/qt_icon_view.h"
#include "platform/linux/qt/qt_pop_up_button.h"
#include "platform/linux/qt/qt_view.h"
#include "platform/windowing.h"

namespace vlm::platform::qt {

class QtWindow final : public Window {
public:
    explicit QtWindow(std::unique_ptr<DialogWindow> dialog) : _dialog(dialog.release()) {}
    ~QtWindow() override;

    View& contentView() override { return *view(_dialog); }
    PopUpButton* popUpButton(std::string_view name) override;
    IconView* iconView(std::string_view name) override;
    TextLabel* textLabel(std::string_view name) override;
    void onClick(std::string_view button, std::function<void()> action) override;
    void setLevel(int level) override;
    void centre() override;
    void makeKeyAndOrderFront() override;
    void showSheet(const Alert& alert, std::function<void()> dismissed) override;
    void close() override;

private:
    View* view(QWidget* widget);

    // A label that the description says is for a picture.
    static bool isForPicture(const QLabel& label);

    DialogWindow* const _dialog;
    bool _isClosed = false;
    std::vector<QPointer<QWidget>> _sheets;
    std::map<QWidget*, std::unique_ptr<QtView>> _views;
    std::map<std::string, std::unique_ptr<QtPopUpButton>, std::less<>> _popUps;
    std::map<std::string, std::unique_ptr<QtIconView>, std::less<>> _icons;
    std::map<std::string, std::unique_ptr<TextLabel>, std::less<>> _labels;
};

}  // namespace vlm::platform::qt
