// Forked: a function in a process of its own, which ends with the object.
//
// In it, another file system may be mounted, which nobody else sees.
//
// While the test has other threads, the function does nothing but wait.

#pragma once

#include <sched.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <string>
#include <system_error>
#include <utility>

namespace vlm::test {

class Forked {
public:
    // The function's answer is the exit status.
    template <typename Function>
    explicit Forked(Function function) : _pid(::fork()) {
        if (_pid < 0) throw std::system_error(errno, std::generic_category(), "fork");
        if (_pid != 0) return;
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        ::_exit(function());
    }
    Forked(Forked&& other) noexcept : _pid(std::exchange(other._pid, -1)) {}
    Forked& operator=(Forked&&) = delete;
    ~Forked() { kill(); }

    // The exit status, or 128 and the signal that ended it.
    int wait() {
        int status = 0;
        ::waitpid(std::exchange(_pid, -1), &status, 0);
        return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    }

    void kill() {
        if (_pid <= 0) return;
        ::kill(_pid, SIGKILL);
        wait();
    }

private:
    pid_t _pid;
};

// For the function: false where this is not allowed.
inline bool mountForThisProcess(const std::string& folder, const char* type, const char* options) {
    return ::unshare(CLONE_NEWNS) == 0 &&
           ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
           ::mount("none", folder.c_str(), type, 0, options) == 0;
}

// The exit status of a function that could not do what it is for.
inline constexpr int kUnavailable = 77;

}  // namespace vlm::test
