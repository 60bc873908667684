// StagedFile: new content for a file, durable under another name before it takes the file's place.
//
// Whoever opens the file finds the old content whole or the new one whole, whatever happens to this
// process or to the machine. The caller holds a lock that keeps others from the staging name.
//
// Threads:  one at a time. Blocking: until the disk has the data.
// Errors:   false, and the reason in errno; the file then is as it was.
// In tests: tests/integration/preferences/durability_test.cpp

#pragma once

#include <sys/types.h>

#include <cstdint>
#include <span>
#include <string>
#include <utility>

#include "platform/linux/file_descriptor.h"

namespace vlm::platform {

struct FileAttributes {
    mode_t mode = 0;
    uid_t owner = 0;
};

class StagedFile {
public:
    // The folder, open for reading, must outlive the object.
    StagedFile(const FileDescriptor& folder, std::string stagingName)
        : _folder(folder), _stagingName(std::move(stagingName)) {}
    ~StagedFile();
    StagedFile(const StagedFile&) = delete;
    StagedFile& operator=(const StagedFile&) = delete;

    // What a killed process has left under the staging name gives way.
    bool write(std::span<const std::uint8_t> content, const FileAttributes& attributes);

    // Gives the written file its name. False also when only the disk's word for it is missing.
    bool putInPlace(const std::string& name);

private:
    const FileDescriptor& _folder;
    std::string _stagingName;
    bool _isStaged = false;
};

}  // namespace vlm::platform
