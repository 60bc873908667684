#include "tool/dialog_control.h"

#include "platform/notifications.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "tool/exit_status.h"
#include "util/bind_utils.h"
#include "util/tool_identifier.h"

namespace vlm {

namespace {

void printState(bool enabled, Console& console) {
    console.print(
        platform::text("SmartCard Pairing dialog is {}.", enabled ? "enabled" : "disabled"));
}

}  // namespace

void forceBindUi(Console& console) {
    if (BindUtils::isBindEnabled()) {
        platform::current().notifications().post(kForceBindUi);
    } else {
        console.print("Pairing UI is disabled.");
    }
}

int runPairingUiCommand(const Options& options, Console& console) {
    if (options.pairingUi == "status") {
        printState(BindUtils::isBindAllowed(), console);
        return kExitSuccess;
    }

    const bool allowed = options.pairingUi == "enable";
    BindUtils::setBindAllowed(allowed);
    if (options.verbose) printState(allowed, console);
    return kExitSuccess;
}

}  // namespace vlm
