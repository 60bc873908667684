// Sandbox: confines this process for good, and names the user's private folders.
//
// Threads:   call from the only thread of the process; every later thread is confined too.
// Blocking:  no.
// Errors:    each operation says what went wrong, by the system's error number or a status.
// Behind it: platform/linux/landlock_sandbox.h
// In tests:  tests/fakes/fake_sandbox.h, tests/integration/sandbox/

#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/types.h"

namespace vlm::platform {

struct SandboxParameter {
    std::string_view name;
    std::string value;
};

// A folder, or the system error number that says why there is none.
struct FolderAnswer {
    std::string path;     // empty when there is none
    int errorNumber = 0;  // errno
};

// Entering a profile: 0, or a status and the reason for it.
struct SandboxAnswer {
    Status status = kSuccess;
    std::string errorText;
};

class Sandbox {
public:
    virtual ~Sandbox() = default;

    // The user's private folders, made on first use with mode 0700. A folder that exists and
    // belongs to somebody else, or that others may enter, is never handed out.
    virtual FolderAnswer userTemporaryFolder() = 0;
    virtual FolderAnswer userCacheFolder() = 0;

    // Confines the process to what the named profile allows, with the profile's parameters
    // replaced by these values. There is no way out again. A profile that is missing or malformed
    // is a failure; a kernel that can enforce only part of it is not: the log names what is left
    // open.
    virtual SandboxAnswer enter(std::string_view profileName,
                                const std::vector<SandboxParameter>& parameters) = 0;
};

}  // namespace vlm::platform
