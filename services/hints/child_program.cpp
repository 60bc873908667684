#include "services/hints/child_program.h"

#include <fcntl.h>
#include <grp.h>
#include <linux/close_range.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstring>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/status.h"

namespace vlm::service {

namespace {

std::vector<char*> pointersTo(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    for (auto& text : texts) pointers.push_back(text.data());
    pointers.push_back(nullptr);
    return pointers;
}

// The next functions run in the child, between fork and exec.

void becomeUser(uid_t user, gid_t group) {
    if (setgroups(1, &group) != 0 || setresgid(group, group, group) != 0 ||
        setresuid(user, user, user) != 0)
        _exit(127);
}

void takeDefaultSignals() {
    struct sigaction usual = {};
    usual.sa_handler = SIG_DFL;
    for (int number = 1; number < NSIG; ++number) sigaction(number, &usual, nullptr);
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
}

void takeStreams(int socket) {
    const int nothing = open("/dev/null", O_RDWR | O_CLOEXEC);
    if (nothing < 0 || dup2(socket, STDIN_FILENO) < 0 || dup2(socket, STDOUT_FILENO) < 0 ||
        dup2(nothing, STDERR_FILENO) < 0)
        _exit(127);
    // A kernel without it has to trust that every descriptor is marked close-on-exec.
    syscall(SYS_close_range, STDERR_FILENO + 1, ~0U, 0);
}

[[noreturn]] void runInChild(const ProgramToRun& program, int socket, pid_t parent,
                             char* const* arguments, char* const* environment) {
    takeDefaultSignals();
    takeStreams(socket);
    setsid();
    const rlimit noCore = {0, 0};
    setrlimit(RLIMIT_CORE, &noCore);
    if (program.user) becomeUser(*program.user, program.group);
    prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
    // After the change of user, which forgets it.
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    if (getppid() != parent) _exit(127);  // it ended before that
    execve(arguments[0], arguments, environment);
    _exit(127);
}

Refusal failed(const ProgramToRun& program, int error) {
    return {status::kNoPin,
            platform::text("the program {} cannot be run ({})",
                           platform::harmlessText(program.path), std::strerror(error))};
}

}  // namespace

Outcome<ChildProgram> ChildProgram::start(const ProgramToRun& program) {
    if (access(program.path.c_str(), X_OK) != 0) return failed(program, errno);
    int ends[2];
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) != 0)
        return failed(program, errno);
    platform::FileDescriptor ours(ends[0]);
    const platform::FileDescriptor theirs(ends[1]);
    fcntl(ours.get(), F_SETFL, O_NONBLOCK);

    std::vector<std::string> arguments{program.path};
    auto environment = program.environment;
    const auto argumentPointers = pointersTo(arguments);
    const auto environmentPointers = pointersTo(environment);

    const pid_t parent = getpid();
    const pid_t process = fork();
    if (process < 0) return failed(program, errno);
    if (process == 0)
        runInChild(program, theirs.get(), parent, argumentPointers.data(),
                   environmentPointers.data());
    return ChildProgram(process, std::move(ours));
}

ChildProgram::ChildProgram(pid_t process, platform::FileDescriptor socket)
    : _process(process), _socket(std::move(socket)) {}

ChildProgram::ChildProgram(ChildProgram&& other) noexcept
    : _process(std::exchange(other._process, -1)), _socket(std::move(other._socket)) {}

ChildProgram& ChildProgram::operator=(ChildProgram&& other) noexcept {
    std::swap(_process, other._process);
    std::swap(_socket, other._socket);
    return *this;
}

ChildProgram::~ChildProgram() {
    if (_process <= 0) return;
    kill(_process, SIGKILL);
    while (waitpid(_process, nullptr, 0) < 0 && errno == EINTR) {
    }
}

}  // namespace vlm::service
