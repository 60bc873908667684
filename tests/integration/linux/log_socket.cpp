#include "tests/integration/linux/log_socket.h"

#include <sys/socket.h>
#include <sys/un.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <system_error>

namespace vlm::test {

LogSocket::LogSocket(const std::filesystem::path& path)
    : _socket(::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0)) {
    std::filesystem::create_directories(path.parent_path());
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (path.string().size() >= sizeof address.sun_path)
        throw std::runtime_error("too long for a socket: " + path.string());
    std::memcpy(address.sun_path, path.c_str(), path.string().size());
    if (::bind(_socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0)
        throw std::system_error(errno, std::generic_category(), path.string());
}

std::vector<std::string> LogSocket::take() {
    std::vector<std::string> packets;
    std::array<char, 65536> buffer;
    for (ssize_t size = 0; (size = ::recv(_socket.get(), buffer.data(), buffer.size(), 0)) >= 0;)
        packets.emplace_back(buffer.data(), static_cast<std::size_t>(size));
    return packets;
}

// A field is "NAME=text" and a line feed; or, for any bytes, "NAME", a line feed, the size in
// eight bytes, the bytes and a line feed.
JournalFields journalFields(const std::string& packet) {
    JournalFields fields;
    for (std::size_t at = 0; at < packet.size();) {
        const auto end = packet.find('\n', at);
        const auto line = packet.substr(at, end - at);
        const auto equals = line.find('=');
        at = end + 1;
        if (equals != line.npos) {
            fields[line.substr(0, equals)] = line.substr(equals + 1);
            continue;
        }
        std::uint64_t size = 0;
        std::memcpy(&size, packet.data() + at, sizeof size);
        fields[line] = packet.substr(at + sizeof size, size);
        at += sizeof size + size + 1;
    }
    return fields;
}

}  // namespace vlm::test
