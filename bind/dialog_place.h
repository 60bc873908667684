// DialogPlace: where an operation keeps its dialog, between the thread that makes the dialog and
// the main queue that uses it.
//
// A dialog is made once. A place whose dialog was let go, or that was closed before there was one,
// stays taken: nothing may be shown for an operation that has ended.
//
// Ownership: a dialog leaves its place only for whoever takes it, and nothing here copies it by the
//            way; so it goes on the thread of the last one who asked for it.
// Threads:   any.
// In tests:  tests/unit/bind/dialog_place_test.cpp

#pragma once

#include <memory>
#include <mutex>
#include <utility>

#include "bind/pairing_dialog.h"

namespace vlm {

class DialogPlace {
public:
    using Dialog = std::shared_ptr<PairingDialog>;

    // The dialog that is kept now.
    Dialog get() const {
        const std::lock_guard lock(_mutex);
        return _dialog;
    }

    // Puts another one in its place; none frees the place.
    void set(Dialog dialog) {
        const std::lock_guard lock(_mutex);
        _isTaken = dialog != nullptr;
        _dialog.swap(dialog);
    }

    // Keeps the dialog unless the place is taken.
    void keep(const Dialog& dialog) {
        const std::lock_guard lock(_mutex);
        if (!std::exchange(_isTaken, true)) _dialog = dialog;
    }

    bool isTaken() const {
        const std::lock_guard lock(_mutex);
        return _isTaken;
    }

    // Takes a place that is free, so that no dialog gets it; false when it was taken.
    bool closeIfFree() {
        const std::lock_guard lock(_mutex);
        return !std::exchange(_isTaken, true);
    }

    // Gives up the dialog, if there is one; the place stays as it is, taken or free.
    Dialog letGo() {
        const std::lock_guard lock(_mutex);
        return std::exchange(_dialog, nullptr);
    }

private:
    mutable std::mutex _mutex;  // for everything below
    Dialog _dialog;
    bool _isTaken = false;
};

}  // namespace vlm
