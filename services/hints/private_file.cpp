#include "services/hints/private_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "platform/linux/file_descriptor.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

using platform::FileDescriptor;

std::string failure(const std::string& path) {
    if (errno == ELOOP || errno == ENOTDIR)
        return platform::text("{} is a symbolic link or not of the right kind", path);
    return platform::text("{}: {}", path, std::strerror(errno));
}

// Why what is open cannot be trusted; `kind` is S_IFDIR or S_IFREG.
std::optional<std::string> distrust(const FileDescriptor& file, const std::string& path,
                                    mode_t kind, mode_t mode) {
    struct stat state = {};
    if (fstat(file.get(), &state) != 0) return failure(path);
    if ((state.st_mode & S_IFMT) != kind)
        return platform::text("{} is not of the right kind", path);
    if (state.st_uid != geteuid())
        return platform::text("{} belongs to the user {}, and must belong to {}", path,
                              state.st_uid, geteuid());
    if ((state.st_mode & 07777 & ~mode) != 0)
        return platform::text("{} has permissions for others; take them away with \"chmod {} {}\"",
                              path, kind == S_IFDIR ? "0700" : "0600", path);
    if (kind == S_IFREG && state.st_nlink != 1)
        return platform::text("{} has a second name in the file system", path);
    return std::nullopt;
}

}  // namespace

std::optional<std::string> preparePrivateFile(const std::string& path) {
    const std::filesystem::path file(path);
    if (!file.is_absolute() || !file.has_filename())
        return platform::text("{} is no absolute path of a file", path);
    const auto folder = file.parent_path().string();
    if (mkdir(folder.c_str(), 0700) != 0 && errno != EEXIST) return failure(folder);

    const FileDescriptor inside(
        open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!inside) return failure(folder);
    if (auto reason = distrust(inside, folder, S_IFDIR, 0700)) return reason;

    // O_NONBLOCK: a pipe in the file's place must not make this wait.
    const FileDescriptor opened(openat(inside.get(), file.filename().c_str(),
                                       O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC,
                                       0600));
    if (!opened) return failure(path);
    return distrust(opened, path, S_IFREG, 0600);
}

}  // namespace vlm::service
