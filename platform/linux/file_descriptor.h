// FileDescriptor: the owner of one open file descriptor.
//
// Threads: a value; distinct values are independent.

#pragma once

#include <unistd.h>

#include <utility>

namespace vlm::platform {

class FileDescriptor {
public:
    FileDescriptor() = default;
    explicit FileDescriptor(int number) : _number(number) {}
    FileDescriptor(FileDescriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}
    FileDescriptor& operator=(FileDescriptor&& other) noexcept {
        std::swap(_number, other._number);
        return *this;
    }
    ~FileDescriptor() {
        if (_number >= 0) close(_number);
    }

    // The number for a system call; -1 when nothing is open.
    int get() const { return _number; }
    explicit operator bool() const { return _number >= 0; }

private:
    int _number = -1;
};

}  // namespace vlm::platform
