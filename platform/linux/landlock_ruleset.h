// Landlock: confines the files that this process can reach, as far as the kernel knows how.
//
// The kernel's interface grows by numbered versions; each confines more. What this system handles
// goes up to version 6; nothing that later ones can confine concerns it.
//
// Threads:   confines the calling thread and what it starts later.
// Errors:    system error numbers; landlockIsUnavailable() tells a kernel that cannot or must not
// confine
//            from a mistake of ours.
// Source:    linux/landlock.h and the kernel's documentation of Landlock.
// In tests:  tests/integration/sandbox/landlock_ruleset_test.cpp, confined_files_test.cpp

#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/sandbox_profile.h"

namespace vlm::platform {

// What one version of the interface lets a ruleset take away.
struct LandlockRights {
    std::uint64_t files = 0;
    std::uint64_t network = 0;
    std::uint64_t scoped = 0;

    bool operator==(const LandlockRights&) const = default;
};
LandlockRights landlockRights(int version);

// What files may be used for under a rule, of all that `handled` takes away.
std::uint64_t allowedFileRights(PathAccess access, bool isFolder, std::uint64_t handled);

// What this version cannot confine and the system call filter does not refuse, in words for an
// administrator.
std::vector<std::string_view> leftOpenByLandlock(int version);

// An open place (O_PATH is enough) and what is allowed there.
struct LandlockRule {
    FileDescriptor place;
    PathAccess access = PathAccess::Read;
};

struct LandlockAnswer {
    int version = 0;  // the kernel's; 0 when it has no Landlock or forbids it
    int errorNumber = 0;
};

// Confines for good. The caller has set "no new privileges" before.
LandlockAnswer enterLandlock(const std::vector<LandlockRule>& rules);

// True for an error that says that this kernel, or whoever runs this process, does not let it
// confine itself.
bool landlockIsUnavailable(int errorNumber);

}  // namespace vlm::platform
