// FileLock: one process at a time, by a lock on a file that exists for nothing else.
//
// The file is never removed or replaced while anybody works here, so all contenders lock the same
// one. The kernel frees the lock with the process, however that ends. Only the file's owner can
// open it: whoever can open a file can lock it, and could keep everybody else waiting.
//
// Threads:  a value; two threads that take the same lock exclude one another like two processes.
// Blocking: until the lock is free, at most as long as the caller has patience.
// Errors:   none, and the reason in errno: ETIMEDOUT when the patience was over.
// In tests: tests/integration/preferences/writers_test.cpp

#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <utility>

#include "platform/linux/file_descriptor.h"

namespace vlm::platform {

class FileLock {
public:
    // Locks the file of that name in the folder; the file is made when it is missing.
    static std::optional<FileLock> take(const FileDescriptor& folder, const std::string& name,
                                        std::chrono::milliseconds patience);

    FileLock(FileLock&&) noexcept = default;
    FileLock& operator=(FileLock&&) = delete;
    ~FileLock();

private:
    explicit FileLock(FileDescriptor file) : _file(std::move(file)) {}

    FileDescriptor _file;
};

}  // namespace vlm::platform
