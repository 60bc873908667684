// The effective user's private folders: where they may be, and how one is made safely.
//
// Threads:  any; the environment must not change meanwhile.
// Blocking: no more than the file system does.
// Errors:   a place that cannot be trusted is passed over for the next one; when none is left, the
//           answer is the system's error number of the last one.
// In tests: tests/integration/sandbox/user_folders_test.cpp

#pragma once

#include <optional>
#include <string>

#include "platform/sandbox.h"

namespace vlm::platform {

// The places that the environment and the accounts name, none for what they leave out. A variable
// counts when it names an absolute path, and the program does not run with raised privileges.
struct UserPlaces {
    std::optional<std::string> runtimeFolder;           // XDG_RUNTIME_DIR
    std::optional<std::string> cacheHome;               // XDG_CACHE_HOME
    std::optional<std::string> home;                    // HOME
    std::optional<std::string> accountHome;             // of the effective user's account
    std::optional<std::string> configurationHome = {};  // XDG_CONFIG_HOME

    static UserPlaces ofThisEnvironment();  // without the account
    static UserPlaces ofThisProcess();
};

FolderAnswer userTemporaryFolder(const UserPlaces& places);
FolderAnswer userCacheFolder(const UserPlaces& places);

// The folder that the user's preferences lie in, whether it is there or not; none for a user
// without a home.
std::optional<std::string> configurationHome(const UserPlaces& places);

// Our folder in that one, for the user's preferences. There is one place for it only, since what is
// written in one must not be looked for in another. It may be a link, and others may read it.
FolderAnswer userConfigurationFolder(const UserPlaces& places);

}  // namespace vlm::platform
