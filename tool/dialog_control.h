// Control of the pairing dialog: asking for it, and the user's preference whether to be asked at
// all.

#pragma once

#include "tool/console.h"
#include "tool/options.h"

namespace vlm {

// Asks the agent to show the dialog now, unless the machine has it turned off. Whether anybody
// hears that shows in the log only.
void forceBindUi(Console& console);

// Shows or sets the user's preference; the answer is an exit status, and always success: a
// preference that could not be written shows in the log.
int runPairingUiCommand(const Options& options, Console& console);

}  // namespace vlm
