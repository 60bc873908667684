#include "platform/linux/open_or_make_folder.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>

namespace vlm::platform {

FileDescriptor openOrMakeFolder(const FileDescriptor& parent, const std::string& name, mode_t mode,
                                int flags) {
    const bool made = mkdirat(parent.get(), name.c_str(), mode) == 0;
    if (!made && errno != EEXIST) return {};
    FileDescriptor opened(openat(parent.get(), name.c_str(), flags));
    struct stat status {};
    // A strict mask would hide the machine's preferences from its users.
    if (made && opened && fstat(opened.get(), &status) == 0 && (status.st_mode & mode) != mode &&
        fchmodat(parent.get(), name.c_str(), mode, 0) != 0)
        return {};
    return opened;
}

}  // namespace vlm::platform
