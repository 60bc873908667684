// What becomes of unlock keys that are stored already.
//
// Threads: the event loop's. Blocking: for the database only. Errors: refusals.
// In tests: tests/unit/services/unlock_key_changes_test.cpp

#pragma once

#include <cstddef>
#include <optional>

#include "services/hints/caller.h"
#include "services/hints/outcome.h"
#include "services/hints/request.h"
#include "services/hints/unlock_key_store.h"

namespace vlm::service {

// The one that the request names. None there is no refusal: it goes with its pairing, too.
std::optional<Refusal> eraseUnlockKey(UnlockKeyStore& keys, const Caller& caller,
                                      const Request& request);

// Wraps the request's password in the place of the old one, for every card of the account; how many
// there are. All of them, or none.
Outcome<std::size_t> wrapAnew(UnlockKeyStore& keys, const Caller& caller, const Request& request);

}  // namespace vlm::service
