// Pairing with an administrator's consent: asks for the right, pairs, and stores the unlock key.
//
// Threads:  a background one; no window is touched here.
// Blocking: until the administrator, the card and whoever types its PIN are done.
// In tests: tests/unit/ui/bind_dialog_pairing_test.cpp, bind_dialog_threads_test.cpp

#pragma once

#include <optional>

#include "bind/bind_operation.h"

namespace vlm {

// With what an operation is to finish.
struct PairingOutcome {
    BindResult result = BindResult::Succeeded;
    std::optional<platform::Error> error;
    bool lacksUnlockKey = false;  // paired, and the person has to be told of this first
};

PairingOutcome pairWithAuthorization(BindOperation& operation,
                                     const BindOperation::OptionalHash& publicKeyHash);

}  // namespace vlm
