// An alert as a sheet on a window: it keeps that window, and only that one, from being used.

#pragma once

#include <QMessageBox>
#include <functional>

#include "platform/windowing.h"

namespace vlm::platform::qt {

// Shown; belongs to its parent and deletes itself when it was dismissed.
QMessageBox* openSheet(QWidget* parent, const Alert& alert, std::function<void()> dismissed);

}  // namespace vlm::platform::qt
