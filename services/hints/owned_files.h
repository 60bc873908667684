// Plain files that nobody but their owner can have written, in a folder of which the same is true.
// No link is followed, and a name that begins with a dot hides its file.
//
// Threads: any. Blocking: for the disk, never on a pipe or device.
// Errors:  sentences for the log.
// In tests: tests/unit/services/trust/trust_folder_test.cpp

#pragma once

#include <sys/types.h>

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "platform/linux/file_stamp.h"
#include "platform/types.h"

namespace vlm::service {

struct OwnedFiles {
    std::map<std::string, platform::Bytes> contents;  // by path
    std::vector<std::string> problems;                // what does not count, and why
};

// Of one file, of all in one folder, and how many those may be.
inline constexpr std::size_t kMostOwnedFileBytes = std::size_t{32} << 20U;
inline constexpr std::size_t kMostOwnedBytes = std::size_t{128} << 20U;
inline constexpr std::size_t kMostOwnedFiles = 20'000;

// A folder that is not there has no files, and no problem.
OwnedFiles readOwnedFiles(const std::string& folder, uid_t owner);

// Why the folder does not count; none when it does, or is not there.
std::optional<std::string> distrustOfFolder(const std::string& folder, uid_t owner);

// The stamps of a folder and its files by path; none for what is too young to tell its next change
// from the last one.
using FileStamps = std::map<std::string, std::optional<platform::FileStamp>>;
void addStamps(const std::string& folder, FileStamps& stamps);

}  // namespace vlm::service
