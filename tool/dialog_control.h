// Control of the pairing dialog: running the agent that shows it, asking for it, and the user's
// preference whether to be asked at all. This version has no dialog: each of these says so, and
// that is a failure for the command that needed it.

#pragma once

#include "tool/console.h"
#include "tool/options.h"

namespace vlm {

// Runs as the on-demand agent; the answer is an exit status.
int runAgent(Console& console);

// Asks the agent to show the dialog now.
void forceBindUi(Console& console);

// Shows or sets the user's preference; the answer is an exit status.
int runPairingUiCommand(const Options& options, Console& console);

}  // namespace vlm
