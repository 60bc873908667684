#include "services/keychain/keyring_control.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <span>
#include <utility>

#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

using namespace std::chrono_literals;

constexpr auto kPatience = 10s;
constexpr std::uint32_t kUnlock = 1;

enum Result : std::uint32_t { kOk = 0, kDenied = 1 };

void putNumber(std::span<char> place, std::uint32_t number) {
    for (std::size_t at = 0; at < 4; ++at)
        place[at] = static_cast<char>(number >> (8U * (3U - static_cast<unsigned>(at))));
}

std::uint32_t numberAt(const unsigned char* place) {
    std::uint32_t number = 0;
    for (std::size_t at = 0; at < 4; ++at) number = number << 8U | place[at];
    return number;
}

Secret unlockRequest(const Secret& password) {
    constexpr std::size_t kNumbers = 12;
    const auto text = password.text();
    auto request = Secret::ofSize(1 + kNumbers + text.size());
    const auto place = request.memory();
    putNumber(place.subspan(1), static_cast<std::uint32_t>(kNumbers + text.size()));
    putNumber(place.subspan(5), kUnlock);
    putNumber(place.subspan(9), static_cast<std::uint32_t>(text.size()));
    std::ranges::copy(text, place.subspan(1 + kNumbers).begin());
    return request;
}

// A password is given to nobody else, whoever made the socket; systemd's is the user's own, too.
bool isOwn(int socket) {
    ucred peer = {};
    socklen_t size = sizeof peer;
    return ::getsockopt(socket, SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0 &&
           (peer.uid == ::geteuid() || peer.uid == 0);
}

}  // namespace

KeyringControl::KeyringControl(sd_event* event, const std::string& socket, const Secret& password,
                               Answer answer)
    : _answer(std::move(answer)) {
    if (const auto why = send(socket, password); !why.empty()) {
        _time = callSoon(event, [this, why] { fail(why); });
        return;
    }
    _readable = callWhenReadable(event, _socket.get(), [this] { read(); });
    _time = callAfter(event, kPatience, [this] { fail("it does not answer"); });
}

std::string KeyringControl::send(const std::string& socket, const Secret& password) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    if (socket.size() >= sizeof address.sun_path) return "the path of its socket is too long";
    std::memcpy(address.sun_path, socket.data(), socket.size());
    _socket =
        platform::FileDescriptor(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
    if (::connect(_socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0)
        return std::string("its socket cannot be reached: ") + std::strerror(errno);
    if (!isOwn(_socket.get())) return "its socket is another user's";
    const auto request = unlockRequest(password);
    const auto text = request.text();
    const auto sent = ::send(_socket.get(), text.data(), text.size(), MSG_NOSIGNAL);
    return sent == static_cast<ssize_t>(text.size()) ? "" : "it does not listen";
}

void KeyringControl::read() {
    const auto count =
        ::recv(_socket.get(), _reply.data() + _received, _reply.size() - _received, 0);
    if (count < 0 && (errno == EAGAIN || errno == EINTR)) return;
    if (count <= 0) return fail("it hung up");
    _received += static_cast<std::size_t>(count);
    if (_received < _reply.size()) return;
    if (numberAt(_reply.data()) != _reply.size()) return fail("its answer cannot be understood");
    switch (numberAt(_reply.data() + 4)) {
        case kOk:
            return end(KeyringVerdict::Opened);
        case kDenied:
            return end(KeyringVerdict::Refused);
        default:
            return fail("it failed");
    }
}

void KeyringControl::fail(const std::string& why) {
    kLog.error("the login keyring could not be given a password: {}", why);
    end(KeyringVerdict::Failed);
}

// The answer may well destroy this object.
void KeyringControl::end(KeyringVerdict verdict) {
    _readable.reset();
    _time.reset();
    std::exchange(_answer, nullptr)(verdict);
}

}  // namespace vlm::service
