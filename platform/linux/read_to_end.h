// What is left of an open file, of any kind, up to a limit.
//
// Errors: none, and the reason in errno, when reading fails.

#pragma once

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <optional>

#include "platform/types.h"

namespace vlm::platform {

// One byte more than the most when there are more. The expected size saves room and calls; a file
// may grow meanwhile, and one of the kernel's claims to be empty.
inline std::optional<Bytes> readToEnd(int file, std::size_t most, std::size_t expected = 4095) {
    Bytes content(std::min(expected, most) + 1);
    std::size_t size = 0;
    while (size <= most) {
        if (size == content.size()) content.resize(std::min(2 * size, most + 1));
        const ssize_t count = read(file, content.data() + size, content.size() - size);
        if (count == 0) break;
        if (count < 0 && errno != EINTR) return std::nullopt;
        if (count > 0) size += static_cast<std::size_t>(count);
    }
    content.resize(size);
    return content;
}

}  // namespace vlm::platform
