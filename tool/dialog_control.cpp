#include "tool/dialog_control.h"

#include "tool/exit_status.h"

namespace vlm {

int runAgent(Console& console) {
    console.complain("Agent mode is not available in this version.");
    return kExitFailure;
}

void forceBindUi(Console& console) {
    console.complain("Notifications are not available in this version.");
}

int runPairingUiCommand(const Options&, Console& console) {
    console.complain("The pairing preference is not available in this version.");
    return kExitFailure;
}

}  // namespace vlm
