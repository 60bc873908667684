#include "services/vlmctl/doctor/checks.h"

namespace vlm::control::doctor {

// The login keyring belongs to a session; root, and who came from afar, have none.
Findings checkKeyring(const Patient& patient) {
    if (!patient.answers || patient.isRoot || patient.runtimeFolder.empty()) return {};
    // As the session tells it, and not below any other root.
    if (MachineFiles().has(patient.runtimeFolder + "/keyring/control"))
        return {ok("keyring", "one runs in this session")};
    return {warning("keyring", "no keyring runs in this session that a login could open",
                    "Install gnome-keyring and its PAM module (libpam-gnome-keyring), and log in "
                    "again.")};
}

}  // namespace vlm::control::doctor
