#pragma once

#include <sys/types.h>

#include <string>

#include "platform/linux/file_descriptor.h"

namespace vlm::platform {

// Opens the folder below the parent, with these flags of open(). One that is missing is made, with
// this mode whatever the mask of the process is. Nothing is open when that fails, and the reason is
// in errno.
FileDescriptor openOrMakeFolder(const FileDescriptor& parent, const std::string& name, mode_t mode,
                                int flags);

}  // namespace vlm::platform
