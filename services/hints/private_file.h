// A file that only this program's user may touch, in a folder that only this user may enter.
//
// Blocking: for the disk. Errors: a sentence for people.
// In tests: tests/unit/services/private_file_test.cpp

#pragma once

#include <optional>
#include <string>

namespace vlm::service {

// Makes the file, and the folder that it is in, when they are not there (modes 0600 and 0700), and
// checks them when they are. The answer is why they cannot be trusted: a symbolic link, another
// owner than the effective user, permissions for others.
std::optional<std::string> preparePrivateFile(const std::string& path);

}  // namespace vlm::service
