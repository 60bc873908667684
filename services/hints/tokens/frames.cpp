#include "services/hints/tokens/frames.h"

#include <sys/socket.h>
#include <sys/uio.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>

namespace vlm::service {
namespace {

constexpr std::size_t kHeader = 4;
using Header = std::array<std::uint8_t, kHeader>;

Header headerOf(std::size_t size) {
    Header header{};
    for (std::size_t i = 0; i < kHeader; ++i)
        header[i] = static_cast<std::uint8_t>((size >> (8 * i)) & 0xFFU);
    return header;
}

std::size_t sizeIn(std::span<const std::uint8_t> header) {
    std::size_t size = 0;
    for (std::size_t i = 0; i < kHeader; ++i) size |= std::size_t{header[i]} << (8 * i);
    return size;
}

bool readWhole(int socket, void* place, std::size_t size) {
    auto* next = static_cast<char*>(place);
    while (size > 0) {
        const ssize_t got = read(socket, next, size);
        if (got < 0 && errno == EINTR) continue;
        if (got <= 0) return false;
        next += got;
        size -= static_cast<std::size_t>(got);
    }
    return true;
}

std::optional<std::size_t> readHeader(int socket, std::size_t most) {
    Header header{};
    if (!readWhole(socket, header.data(), header.size())) return {};
    const std::size_t size = sizeIn(header);
    if (size > most) return {};
    return size;
}

bool writeWhole(int socket, std::span<const std::uint8_t> data) {
    while (!data.empty()) {
        const ssize_t put = send(socket, data.data(), data.size(), MSG_NOSIGNAL);
        if (put < 0 && errno == EINTR) continue;
        if (put <= 0) return false;
        data = data.subspan(static_cast<std::size_t>(put));
    }
    return true;
}

// sendmsg() only reads, but has the structure in common with a function that writes.
iovec pieceOf(const void* data, std::size_t size) { return {const_cast<void*>(data), size}; }

}  // namespace

std::optional<Bytes> readFrame(int socket) {
    const auto size = readHeader(socket, kMostFrameBytes);
    if (!size) return {};
    Bytes content(*size);
    if (!readWhole(socket, content.data(), content.size())) return {};
    return content;
}

std::optional<Secret> readSecretFrame(int socket, std::size_t most) {
    const auto size = readHeader(socket, most);
    if (!size) return {};
    Secret secret = Secret::ofSize(*size);
    if (!readWhole(socket, secret.memory().data(), *size)) return {};
    return secret;
}

bool writeFrame(int socket, std::span<const std::uint8_t> content) {
    if (content.size() > kMostFrameBytes) return false;
    const Header header = headerOf(content.size());
    return writeWhole(socket, header) && writeWhole(socket, content);
}

bool sendFrames(int socket, std::span<const std::uint8_t> content, const Secret* secret) {
    const Header header = headerOf(content.size());
    std::array<iovec, 4> pieces = {pieceOf(header.data(), header.size()),
                                   pieceOf(content.data(), content.size())};
    msghdr message = {};
    message.msg_iov = pieces.data();
    message.msg_iovlen = 2;
    Header secretHeader{};
    if (secret != nullptr) {
        secretHeader = headerOf(secret->text().size());
        pieces[2] = pieceOf(secretHeader.data(), secretHeader.size());
        pieces[3] = pieceOf(secret->text().data(), secret->text().size());
        message.msg_iovlen = 4;
    }
    std::size_t size = 0;
    for (std::size_t i = 0; i < message.msg_iovlen; ++i) size += pieces[i].iov_len;
    const ssize_t sent = sendmsg(socket, &message, MSG_NOSIGNAL | MSG_DONTWAIT);
    return sent >= 0 && static_cast<std::size_t>(sent) == size;
}

FrameState FrameAssembler::add(std::span<const std::uint8_t> piece) {
    _received.insert(_received.end(), piece.begin(), piece.end());
    return state();
}

FrameState FrameAssembler::state() const {
    if (_received.size() < kHeader) return FrameState::Incomplete;
    if (announced() > kMostFrameBytes) return FrameState::TooLong;
    return missing() == 0 ? FrameState::Complete : FrameState::Incomplete;
}

std::size_t FrameAssembler::missing() const {
    const std::size_t whole = _received.size() < kHeader ? kHeader : kHeader + announced();
    return whole - std::min(whole, _received.size());
}

std::size_t FrameAssembler::announced() const { return sizeIn(_received); }

Bytes FrameAssembler::take() {
    if (state() != FrameState::Complete) return {};
    const auto begin = _received.begin() + kHeader;
    const auto end = begin + static_cast<std::ptrdiff_t>(announced());
    Bytes content(begin, end);
    _received.erase(_received.begin(), end);
    return content;
}

std::span<std::uint8_t> SecretAssembler::room() {
    if (_received < kHeader) return std::span(_header).subspan(_received);
    return _secret.octets().subspan(_received - kHeader);
}

FrameState SecretAssembler::filled(std::size_t size) {
    const bool hadHeader = _received >= kHeader;
    _received += size;
    if (_received < kHeader) return FrameState::Incomplete;
    if (sizeIn(_header) > _most) return FrameState::TooLong;
    if (!hadHeader) _secret = Secret::ofSize(sizeIn(_header));
    return room().empty() ? FrameState::Complete : FrameState::Incomplete;
}

}  // namespace vlm::service
