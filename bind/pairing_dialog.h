// PairingDialog: the pairing window as an operation knows it.
//
// Ownership: shared between the operation that it serves and whatever runs for it; it holds that
//            operation, and is let go when the operation has ended.
// Threads:   the main queue's only; it may be made on any thread.

#pragma once

#include <functional>
#include <memory>

#include "platform/windowing.h"

namespace vlm {

class BindOperation;

class PairingDialog {
public:
    virtual ~PairingDialog() = default;

    // False when there is no window to show.
    virtual bool showWindow() = 0;
    virtual void refreshIdentities() = 0;
    virtual void close() = 0;

    // As a sheet on its window; calls once it was dismissed, also when there is no window.
    virtual void showAlert(const platform::Alert& alert, std::function<void()> dismissed) = 0;
};

// Makes the dialog of an operation; null when it cannot be made.
using PairingDialogMaker =
    std::function<std::shared_ptr<PairingDialog>(const std::shared_ptr<BindOperation>&)>;

}  // namespace vlm
