#include "services/vlmctl/read_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <utility>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/read_to_end.h"
#include "platform/text.h"

namespace vlm::control {

namespace {

FileContent failure() { return {std::nullopt, std::strerror(errno)}; }

FileContent tooLarge(std::size_t most) {
    return {std::nullopt, platform::text("it has more than {} bytes", most)};
}

FileContent contentOf(int file, std::size_t most) {
    auto bytes = platform::readToEnd(file, most);
    if (!bytes) return failure();
    if (bytes->size() > most) return tooLarge(most);
    return {std::move(bytes), {}};
}

}  // namespace

FileContent readFile(const std::string& path, std::size_t most) {
    const platform::FileDescriptor file(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    if (!file) return failure();
    struct stat state = {};
    if (fstat(file.get(), &state) != 0) return failure();
    if (S_ISDIR(state.st_mode)) return {std::nullopt, "it is a folder"};
    if (!S_ISREG(state.st_mode)) return {std::nullopt, "it is not a regular file"};
    if (static_cast<std::size_t>(state.st_size) > most) return tooLarge(most);
    return contentOf(file.get(), most);
}

FileContent readStandardInput(std::size_t most) { return contentOf(STDIN_FILENO, most); }

}  // namespace vlm::control
