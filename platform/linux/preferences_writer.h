// Puts changes of one record of preferences on the disk.
//
// Under the record's lock the file is read again, so that what others have written meanwhile stays,
// and replaced in one step. Entries that nobody here knows stay with their types and their order;
// comments in the text do not. It is XML where XML can hold all values, for the people who look
// into /etc, else binary.
//
// A file that is malformed or not trusted is kept aside as DOMAIN.plist.malformed-N or
// DOMAIN.plist.untrusted-N, with the first N that is free. One that cannot be read is left alone.
//
// Beside DOMAIN.plist lie .DOMAIN.plist.lock for good and .DOMAIN.plist.new for the moment.
//
// Threads:  any. Blocking: on the disk, and on other writers up to the folder's patience.
// Errors:   the log tells why.
// In tests: tests/integration/preferences/{writers,durability,set_aside}_test.cpp

#pragma once

#include <string_view>
#include <vector>

#include "platform/linux/pending_changes.h"
#include "platform/linux/preferences_folders.h"

namespace vlm::platform {

bool writeChanges(const PreferencesFolder& rules, std::string_view domain,
                  const std::vector<PreferencesChange>& changes);

}  // namespace vlm::platform
