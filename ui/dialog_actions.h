// DialogActions: what the buttons of a pairing dialog do to its operation.
//
// Ownership: whoever makes the dialog gives them; they may let the dialog go.
// Threads:   called on the main queue.

#pragma once

#include <functional>
#include <memory>

#include "bind/bind_operation.h"

namespace vlm {

struct DialogActions {
    using Operation = std::shared_ptr<BindOperation>;

    // With the key that was chosen; none when there was none to choose.
    std::function<void(const Operation&, const BindOperation::OptionalHash&)> okClicked;
    std::function<void(const Operation&)> cancelClicked;
    std::function<void(const Operation&)> dontShowAgainClicked;
};

}  // namespace vlm
