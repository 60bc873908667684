// The folders that preferences lie in, and whom each is trusted to.
//
//   managed        /etc/vlm/managed
//   any user       /etc/vlm/preferences
//   current user   $XDG_CONFIG_HOME/vlm/hosts/HOST, with ~/.config for a variable that is not set
//   or
//                  names no absolute path, and the account's home for a HOME of that kind
//
// HOST is the machine's id, since several machines may share a home folder and the id outlives a
// change of name; a machine that has none is known by its name. Nothing in the environment moves
// the folders in /etc: programs that let people in go by them.
//
// A record counts when the folder's owner, and nobody else, can have written it. For the machine's
// records that is the superuser alone. A user's own group may write the user's, as with every file
// that is made under the usual mask 002.
//
// Threads:  values. Errors: none, and the reason in errno.
// In tests: tests/integration/preferences/folders_test.cpp

#pragma once

#include <sys/stat.h>

#include <chrono>
#include <optional>
#include <string>
#include <vector>

#include "platform/linux/file_descriptor.h"

namespace vlm::platform {

struct PreferencesFolder {
    // Two parts of the path: the base, which other programs use too and which may be reached
    // through links, and the names of our own folders in it, which may not be links to be written.
    std::string base;
    std::vector<std::string> own;

    uid_t owner = 0;
    mode_t forbidden = S_IWGRP | S_IWOTH;  // on what is trusted
    mode_t folderMode = 0755;              // of what is made
    mode_t fileMode = 0644;
    // How long a writer waits for others. A write takes milliseconds, some seconds on a disk that
    // is very busy; whoever holds the lock longer is stopped, and must not stop everybody else.
    std::chrono::milliseconds patience = std::chrono::seconds(10);

    std::string path() const;
    bool trusts(const struct stat& status) const;
};

struct PreferencesFolders {
    PreferencesFolder managed;
    PreferencesFolder anyUser;
    std::optional<PreferencesFolder> currentUser;  // none for a user without a home

    static PreferencesFolders ofThisMachine();
};

// The folder for reading, where it is and whether it is trusted or not.
FileDescriptor openFolder(const PreferencesFolder& folder);

// The folder for writing, made when it is missing, trusted all the way down from its base.
FileDescriptor openTrustedFolder(const PreferencesFolder& folder);

// A name for this machine that can name a folder, from the content of /etc/machine-id and from the
// host name.
std::string hostIdentifier(const std::string& machineId, const std::string& hostName);

}  // namespace vlm::platform
