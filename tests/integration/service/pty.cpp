#include "pty.h"

#include <fcntl.h>
#include <grp.h>
#include <poll.h>
#include <pty.h>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <stdexcept>

namespace vlm::test {

Pty::Pty(const std::vector<std::string>& arguments, const Child::Options& options) {
    std::array<char, 64> name = {};
    if (openpty(&_screen, &_terminal, name.data(), nullptr, nullptr) != 0)
        throw std::runtime_error("there is no terminal");
    fcntl(_screen, F_SETFD, FD_CLOEXEC);
    _path = name.data();
    if (options.user && fchown(_terminal, *options.user, 0) != 0)
        throw std::runtime_error("the terminal cannot be given to the user");

    auto words = arguments;
    std::vector<char*> pointers;
    for (auto& word : words) pointers.push_back(word.data());
    pointers.push_back(nullptr);
    _pid = fork();
    if (_pid != 0) return;

    setsid();
    ioctl(_terminal, TIOCSCTTY, 0);
    for (int stream = 0; stream < 3; ++stream) dup2(_terminal, stream);
    if (_terminal > 2) close(_terminal);
    for (const auto& [variable, value] : options.environment)
        value ? setenv(variable.c_str(), value->c_str(), 1) : unsetenv(variable.c_str());
    if (options.user &&
        (setgroups(0, nullptr) != 0 || setresgid(*options.user, *options.user, *options.user) ||
         setresuid(*options.user, *options.user, *options.user) != 0))
        _exit(126);
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    execv(pointers[0], pointers.data());
    _exit(127);
}

Pty::~Pty() {
    kill();
    close(_screen);
    close(_terminal);
}

void Pty::kill() {
    if (_pid <= 0) return;
    ::kill(_pid, SIGKILL);
    waitpid(_pid, nullptr, 0);
    _pid = -1;
}

void Pty::type(const std::string& keys) {
    if (write(_screen, keys.data(), keys.size()) != static_cast<ssize_t>(keys.size()))
        throw std::runtime_error("nothing can be typed");
}

bool Pty::waitFor(const std::string& text) {
    const auto deadline = std::chrono::steady_clock::now() + Child::kPatience;
    while (_seen.find(text) == std::string::npos) {
        const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
            deadline - std::chrono::steady_clock::now());
        pollfd readable{_screen, POLLIN, 0};
        if (left.count() <= 0 || poll(&readable, 1, static_cast<int>(left.count())) <= 0)
            return false;
        std::array<char, 4096> piece = {};
        const auto got = read(_screen, piece.data(), piece.size());
        if (got <= 0) return false;
        _seen.append(piece.data(), static_cast<std::size_t>(got));
    }
    return true;
}

bool Pty::echoes() const {
    termios settings = {};
    return tcgetattr(_terminal, &settings) == 0 && (settings.c_lflag & ECHO) != 0;
}

}  // namespace vlm::test
