// CachedRecord: the entries of one preferences record, read again only after a change on the disk.
//
// Every look at it costs one stat(), which tells a change; the file is read anew when the stamp
// that it gives is another, or is too young to tell. So the answer is never an old one.
//
// A file that does not count is told in the log, once for each content.
//
// Threads: one at a time.

#pragma once

#include <string>
#include <string_view>

#include "platform/linux/preferences_folders.h"
#include "platform/linux/preferences_record.h"
#include "platform/property_list.h"

namespace vlm::platform {

class CachedRecord {
public:
    CachedRecord(PreferencesFolder folder, std::string_view domain);

    // Empty for a record that does not count. Valid until the next call.
    const PropertyList::Dictionary& entries();

private:
    bool isCurrent() const;
    PreferencesRecord read() const;
    void tellProblem();

    PreferencesFolder _folder;
    std::string _fileName;
    std::string _path;

    PreferencesRecord _record;
    std::string _toldProblem;
    std::size_t _toldContent = 0;
};

}  // namespace vlm::platform
