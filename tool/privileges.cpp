#include "tool/privileges.h"

#include "platform/platform.h"
#include "platform/process_info.h"

namespace vlm {

namespace {

bool runsAsRoot() { return platform::current().processInfo().effectiveUserId() == 0; }

}  // namespace

bool checkRoot(Console& console) {
    if (runsAsRoot()) return true;
    console.print("This operation requires root privileges.");
    return false;
}

bool checkNoRoot(Console& console) {
    if (!runsAsRoot()) return true;
    console.print("This operation must not be run with root privileges.");
    return false;
}

}  // namespace vlm
