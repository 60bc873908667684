// The screen that nobody sees, and a person in front of it.

#pragma once

#include <QDialog>
#include <QMessageBox>
#include <string>

#include "platform/windowing.h"

namespace vlm::test {

// The real windowing, on that screen and in English.
platform::Windowing& windowingOnScreen();

// The pairing window that was loaded last; null when there is none.
QDialog* bindDialog();

// The part of that window; the test fails when it has none.
template <typename Widget>
Widget& part(const char* name) {
    auto* found = bindDialog() ? bindDialog()->findChild<Widget*>(name) : nullptr;
    if (!found) throw std::runtime_error(std::string("the window has no ") + name);
    return *found;
}

// The sheet that is shown; null when there is none.
QMessageBox* sheet();

void click(const std::string& button);
void press(Qt::Key key);

// What the toolkit does when its loop runs: windows that were let go are gone.
void settle();

}  // namespace vlm::test
