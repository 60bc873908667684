// One record of preferences as it lies on the disk: a property-list file DOMAIN.plist.
//
// Every format of property list is read. A file that is no dictionary, is larger than a record may
// be, or is no plain file, is malformed; one that somebody else can have written is not trusted.
// Neither counts. A link is read through, since whoever may write the folder put it there.
//
// Threads:  values. Blocking: on the file system, never on a pipe or device.
// In tests: tests/integration/preferences/records_test.cpp

#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/file_stamp.h"
#include "platform/linux/preferences_folders.h"
#include "platform/property_list.h"

namespace vlm::platform {

// Room for tens of thousands of settings; a login program is not made to swallow more.
inline constexpr std::size_t kLargestRecord = std::size_t{4} << 20U;  // bytes

// What reading and writing a record may take.
inline constexpr PropertyListLimits kRecordLimits{
    .depth = 512, .objects = std::size_t{1} << 18U, .bytes = std::size_t{16} << 20U};

inline std::string recordFileName(std::string_view domain) {
    return std::string(domain) + ".plist";
}

struct PreferencesRecord {
    enum class State {
        Absent,
        Good,
        Malformed,
        Untrusted,
        Unreadable,  // it may be good: nobody can say
    };
    State state = State::Absent;
    PropertyList::Dictionary entries;  // empty unless it is good
    std::string problem;               // why it does not count; empty when it is good or absent
    std::size_t contentHash = 0;

    // The file that was read. None when a later change might leave the same stamp.
    std::optional<FileStamp> stamp;
};

// Reads the record from its folder, of which the caller knows whether it is trusted.
PreferencesRecord readRecord(const FileDescriptor& folder, const std::string& fileName,
                             const PreferencesFolder& rules);

}  // namespace vlm::platform
