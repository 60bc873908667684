// LandlockSandbox: confines by Landlock (files), a seccomp filter (system calls) and "no new
// privileges", as a profile beside the program says.

#pragma once

#include <vector>

#include "platform/linux/landlock_ruleset.h"
#include "platform/sandbox.h"

namespace vlm::platform {

class LandlockSandbox final : public Sandbox {
public:
    FolderAnswer userTemporaryFolder() override;
    FolderAnswer userCacheFolder() override;

    // Besides the caller's parameters a profile has $(INSTALL_DIR), the folder above the program's,
    // and $(CONFIG_DIR), the folder of the user's preferences. That one is made when it is missing,
    // since a confined process can make it no more.
    SandboxAnswer enter(std::string_view profileName,
                        const std::vector<SandboxParameter>& parameters) override;

private:
    // Kept open: a rule holds for the folder that was opened, and /proc makes a new one in its
    // place once nobody holds it any more.
    std::vector<LandlockRule> _places;
};

}  // namespace vlm::platform
