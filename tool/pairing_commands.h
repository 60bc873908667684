// Pairing and unpairing a user from the command line; the answers are exit statuses.

#pragma once

#include "tool/console.h"
#include "tool/options.h"

namespace vlm {

// The pairing stands, and the command succeeds, also when no unlock key could be stored.
int runPair(const Options& options, Console& console);

int runUnpair(const Options& options, Console& console);

}  // namespace vlm
