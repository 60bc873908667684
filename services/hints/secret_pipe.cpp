#include "services/hints/secret_pipe.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/owned_endpoint.h"

namespace vlm::service {

namespace {

// A sender may have left the pipe blocking, and may hold it open for ever.
bool isPipe(int descriptor) {
    struct stat status {};
    return ::fstat(descriptor, &status) == 0 && S_ISFIFO(status.st_mode);
}

std::optional<std::size_t> readWithoutWaiting(int descriptor, std::span<char> place) {
    const int flags = ::fcntl(descriptor, F_GETFL);
    if (flags < 0 || ::fcntl(descriptor, F_SETFL, flags | O_NONBLOCK) < 0) return std::nullopt;
    std::size_t size = 0;
    while (size < place.size()) {
        const auto count = ::read(descriptor, place.data() + size, place.size() - size);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return std::nullopt;
        if (count == 0) break;
        size += static_cast<std::size_t>(count);
    }
    return size;
}

}  // namespace

std::optional<platform::Endpoint> pipeHolding(const Secret& secret) {
    const auto text = secret.text();
    if (text.empty() || text.size() > kMostSecretBytes) return std::nullopt;
    std::array<int, 2> ends{};
    if (::pipe2(ends.data(), O_CLOEXEC | O_NONBLOCK) < 0) return std::nullopt;
    platform::FileDescriptor reading(ends[0]);
    const platform::FileDescriptor writing(ends[1]);
    // A pipe takes PIPE_BUF bytes at once, or none.
    static_assert(kMostSecretBytes <= 4096);
    if (::write(writing.get(), text.data(), text.size()) != static_cast<ssize_t>(text.size()))
        return std::nullopt;
    return platform::ownedEndpoint(std::move(reading));
}

std::optional<Secret> secretIn(const platform::Endpoint& pipe) {
    if (!pipe.descriptor || !isPipe(*pipe.descriptor)) return std::nullopt;
    auto secret = Secret::ofSize(kMostSecretBytes + 1);
    const auto size = readWithoutWaiting(*pipe.descriptor, secret.memory());
    if (!size || *size == 0 || *size > kMostSecretBytes) return std::nullopt;
    secret.shorten(*size);
    return secret;
}

}  // namespace vlm::service
