#pragma once

#include <cstddef>
#include <optional>
#include <string>

#include "platform/types.h"

namespace vlm::control {

struct FileContent {
    std::optional<platform::Bytes> bytes;
    std::string problem;  // why there are none: a clause, as in "it is a folder"
};

// Reads a regular file of at most so many bytes. Anything else in its place, a pipe or a device for
// instance, is refused without waiting for it.
FileContent readFile(const std::string& path, std::size_t most);

// Reads standard input to its end, whatever it is.
FileContent readStandardInput(std::size_t most);

}  // namespace vlm::control
