#include <netdb.h>
#include <pwd.h>
#include <sched.h>
#include <seccomp.h>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <map>
#include <stdexcept>

#include "attempts.h"

namespace vlm::test {

namespace {

// Bits that the kernel drops from an int argument; a filter must not be taken in by them.
constexpr std::uint64_t kUpperBit = 1ULL << 32U;

int errorOf(long result) { return result < 0 ? errno : 0; }

const std::map<std::string, int> kFamilies = {
    {"unix", AF_UNIX},           {"inet", AF_INET},
    {"inet6", AF_INET6},         {"packet", AF_PACKET},
    {"bluetooth", AF_BLUETOOTH}, {"netlink", AF_NETLINK},
    {"vsock", AF_VSOCK},         {"alg", AF_ALG},
};

int openSocket(const std::string& family) {
    const int type = family == "netlink" ? SOCK_RAW : SOCK_STREAM;
    const int result = socket(kFamilies.at(family), type | SOCK_CLOEXEC, 0);
    if (result < 0) return errno;
    close(result);
    return 0;
}

// Says "ping" to whoever listens there, and wants to hear "pong".
int talk(const std::string& path) {
    struct sockaddr_un address {};
    address.sun_family = AF_UNIX;
    if (path.size() >= sizeof address.sun_path) return ENAMETOOLONG;
    std::memcpy(address.sun_path, path.c_str(), path.size());
    const int peer = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (peer < 0) return errno;
    const auto* generic = static_cast<const struct sockaddr*>(static_cast<const void*>(&address));
    if (connect(peer, generic, sizeof address) != 0) return errno;
    if (send(peer, "ping", 4, MSG_NOSIGNAL) != 4) return errno;
    std::array<char, 4> answer{};
    if (recv(peer, answer.data(), answer.size(), MSG_WAITALL) != 4) return EPROTO;
    close(peer);
    return std::memcmp(answer.data(), "pong", 4) == 0 ? 0 : EPROTO;
}

// Arguments that no call takes: one that is not refused beforehand fails for another reason.
int callWithNonsense(const std::string& name) {
    const int number = seccomp_syscall_resolve_name(name.c_str());
    if (number < 0) throw std::invalid_argument(name + " is no call of this machine");
    return errorOf(syscall(number, -1, -1, -1, -1, -1, -1));
}

int cloneIntoUserNamespace() {
    const long child = syscall(SYS_clone, CLONE_NEWUSER | SIGCHLD, nullptr, nullptr, nullptr, 0L);
    if (child == 0) _exit(0);
    return errorOf(child);
}

int lookUpAccount(const std::string& name) {
    errno = 0;
    if (getpwnam(name.c_str()) != nullptr) return 0;
    return errno != 0 ? errno : ENOENT;
}

int callAs32BitProgram() {
#if defined(__x86_64__)
    long result = 20;  // getpid there
    asm volatile("int $0x80" : "+a"(result) : : "memory", "r8", "r9", "r10", "r11");
    return result == getpid() ? 0 : ENOSYS;
#else
    throw std::invalid_argument("this machine has no such calls");
#endif
}

}  // namespace

int attemptCalls(const std::string& name, Arguments arguments) {
    static char keystroke = 'x';
    if (name == "socket") return openSocket(arguments[0]);
    if (name == "socket-with-upper-bit")
        return errorOf(syscall(SYS_socket, AF_INET | kUpperBit, SOCK_STREAM, 0));
    if (name == "talk") return talk(arguments[0]);
    if (name == "call") return callWithNonsense(arguments[0]);
    if (name == "clone-into-namespace") return cloneIntoUserNamespace();
    if (name == "type-into-terminal") return errorOf(ioctl(STDIN_FILENO, TIOCSTI, &keystroke));
    if (name == "type-into-terminal-with-upper-bit")
        return errorOf(syscall(SYS_ioctl, STDIN_FILENO, TIOCSTI | kUpperBit, &keystroke));
    if (name == "account") return lookUpAccount(arguments[0]);
    if (name == "signal-parent") return errorOf(kill(getppid(), 0));
    if (name == "gain-privileges") return prctl(PR_GET_NO_NEW_PRIVS, 0, 0, 0, 0) == 1 ? EPERM : 0;
    if (name == "x32-call") return errorOf(syscall(0x40000000L | SYS_getpid));
    if (name == "32-bit-call") return callAs32BitProgram();
    return -1;
}

}  // namespace vlm::test
