#include "services/vlmctl/read_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "platform/linux/file_descriptor.h"
#include "platform/text.h"

namespace vlm::control {

namespace {

constexpr std::size_t kPiece = std::size_t{64} << 10U;

FileContent failure() { return {std::nullopt, std::strerror(errno)}; }

FileContent tooLarge(std::size_t most) {
    return {std::nullopt, platform::text("it has more than {} bytes", most)};
}

// To the end, since a file may grow meanwhile, and one of the kernel's claims to be empty.
FileContent readToEnd(int file, std::size_t most) {
    platform::Bytes bytes;
    for (;;) {
        const std::size_t before = bytes.size();
        bytes.resize(std::min(before + kPiece, most + 1));
        const auto count = read(file, bytes.data() + before, bytes.size() - before);
        if (count < 0 && errno != EINTR) return failure();
        bytes.resize(before + (count < 0 ? 0 : static_cast<std::size_t>(count)));
        if (count == 0) return {std::move(bytes), {}};
        if (bytes.size() > most) return tooLarge(most);
    }
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
    return readToEnd(file.get(), most);
}

FileContent readStandardInput(std::size_t most) { return readToEnd(STDIN_FILENO, most); }

}  // namespace vlm::control
