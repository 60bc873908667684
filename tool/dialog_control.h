// Control of the pairing dialog: running the agent that shows it, asking for it, and the user's
// preference whether to be asked at all. This version has no dialog: running the agent says so.

#pragma once

#include "tool/console.h"
#include "tool/options.h"

namespace vlm {

// Runs as the on-demand agent; the answer is an exit status.
int runAgent(Console& console);

// Asks the agent to show the dialog now, unless the machine has it turned off. Whether anybody
// hears that shows in the log only.
void forceBindUi(Console& console);

// Shows or sets the user's preference; the answer is an exit status, and always success: a
// preference that could not be written shows in the log.
int runPairingUiCommand(const Options& options, Console& console);

}  // namespace vlm
