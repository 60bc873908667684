#include "platform/linux/staged_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

namespace vlm::platform {

namespace {

constexpr int kFlags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC;
constexpr mode_t kPermissions = S_IRWXU | S_IRWXG | S_IRWXO;

// Only where there is something to change: a confined process may neither give a file away nor
// change its mode, and has no need to for files of its own user.
bool setAttributes(int file, const FileAttributes& attributes) {
    struct stat now {};
    if (fstat(file, &now) != 0) return false;
    if (now.st_uid != attributes.owner && fchown(file, attributes.owner, now.st_gid) != 0)
        return false;
    return (now.st_mode & kPermissions) == attributes.mode || fchmod(file, attributes.mode) == 0;
}

bool writeAll(int file, std::span<const std::uint8_t> content) {
    while (!content.empty()) {
        const ssize_t count = ::write(file, content.data(), content.size());
        if (count < 0 && errno != EINTR) return false;
        if (count > 0) content = content.subspan(static_cast<std::size_t>(count));
    }
    return true;
}

}  // namespace

bool StagedFile::write(std::span<const std::uint8_t> content, const FileAttributes& attributes) {
    const char* name = _stagingName.c_str();
    if (unlinkat(_folder.get(), name, 0) != 0 && errno != ENOENT) return false;
    const FileDescriptor file(openat(_folder.get(), name, kFlags, attributes.mode));
    if (!file) return false;
    _isStaged = true;
    return setAttributes(file.get(), attributes) && writeAll(file.get(), content) &&
           fsync(file.get()) == 0;
}

bool StagedFile::putInPlace(const std::string& name) {
    if (renameat(_folder.get(), _stagingName.c_str(), _folder.get(), name.c_str()) != 0)
        return false;
    _isStaged = false;
    // Some file systems write their folders through and do not know this call.
    return fsync(_folder.get()) == 0 || errno == EINVAL;
}

StagedFile::~StagedFile() {
    const int before = errno;
    if (_isStaged) unlinkat(_folder.get(), _stagingName.c_str(), 0);
    errno = before;
}

}  // namespace vlm::platform
