#include "platform/linux/file_lock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <cerrno>
#include <ctime>
#include <utility>

namespace vlm::platform {

namespace {

constexpr timespec kBetweenAttempts{0, 1'000'000};
constexpr int kFlags = O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

// Whether the open file still has that name: somebody may have tidied up since it was opened.
bool isStillThere(const FileDescriptor& folder, const std::string& name,
                  const FileDescriptor& file) {
    struct stat named {};
    struct stat opened {};
    return fstatat(folder.get(), name.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0 &&
           fstat(file.get(), &opened) == 0 && named.st_dev == opened.st_dev &&
           named.st_ino == opened.st_ino;
}

}  // namespace

std::optional<FileLock> FileLock::take(const FileDescriptor& folder, const std::string& name,
                                       std::chrono::milliseconds patience) {
    // The kernel offers to wait for ever or not at all; a signal to end the wait would be the whole
    // process's. So this asks again and again.
    const auto deadline = std::chrono::steady_clock::now() + patience;
    do {
        FileDescriptor file(openat(folder.get(), name.c_str(), kFlags, S_IRUSR | S_IWUSR));
        if (!file) return std::nullopt;
        while (flock(file.get(), LOCK_EX | LOCK_NB) != 0) {
            if (errno != EWOULDBLOCK && errno != EINTR) return std::nullopt;
            if (std::chrono::steady_clock::now() >= deadline) {
                errno = ETIMEDOUT;
                return std::nullopt;
            }
            nanosleep(&kBetweenAttempts, nullptr);
        }
        if (isStillThere(folder, name, file)) return FileLock(std::move(file));
    } while (std::chrono::steady_clock::now() < deadline);
    errno = ETIMEDOUT;
    return std::nullopt;
}

FileLock::~FileLock() {
    // Closing would not do when another thread has forked meanwhile: its child holds the file too.
    if (_file) flock(_file.get(), LOCK_UN);
}

}  // namespace vlm::platform
