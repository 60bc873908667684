#include "services/hints/tokens/worker_process.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>
#include <utility>

namespace vlm::service {
namespace {

constexpr int kWorkerSocket = 3;

std::vector<char*> pointersTo(const std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    // execve() only reads them; its parameters are older than const.
    for (const std::string& text : texts) pointers.push_back(const_cast<char*>(text.c_str()));
    pointers.push_back(nullptr);
    return pointers;
}

std::vector<std::string> environmentWith(const std::vector<std::string>& first) {
    std::vector<std::string> environment = first;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        const std::string_view text(*entry);
        const std::string_view name = text.substr(0, text.find('=') + 1);
        if (std::ranges::none_of(first,
                                 [name](const auto& each) { return each.starts_with(name); }))
            environment.emplace_back(text);
    }
    return environment;
}

// Between fork and exec: nothing but calls that are safe after a fork.
[[noreturn]] void become(int socket, pid_t parent, char* const* arguments,
                         char* const* environment) {
    const rlimit none = {0, 0};
    setrlimit(RLIMIT_CORE, &none);
    prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    if (getppid() != parent) _exit(0);  // it has gone already and tells nobody

    sigset_t nothing;
    sigemptyset(&nothing);
    sigprocmask(SIG_SETMASK, &nothing, nullptr);
    static_cast<void>(signal(SIGPIPE, SIG_DFL));

    if (socket == kWorkerSocket)
        fcntl(socket, F_SETFD, 0);
    else
        dup2(socket, kWorkerSocket);
    const int null = open("/dev/null", O_RDWR);
    dup2(null, STDIN_FILENO);
    dup2(null, STDOUT_FILENO);
    closefrom(kWorkerSocket + 1);
    execve(arguments[0], arguments, environment);
    _exit(127);
}

// The C library's own declaration of this is not fit for C++ everywhere.
int openProcess(pid_t pid) { return static_cast<int>(syscall(SYS_pidfd_open, pid, 0)); }

void reap(pid_t pid) {
    while (waitpid(pid, nullptr, 0) < 0 && errno == EINTR) {
    }
}

}  // namespace

Descriptor::Descriptor(Descriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}

Descriptor& Descriptor::operator=(Descriptor&& other) noexcept {
    if (this == &other) return *this;
    close();
    _number = std::exchange(other._number, -1);
    return *this;
}

Descriptor::~Descriptor() { close(); }

void Descriptor::close() {
    if (_number >= 0) ::close(std::exchange(_number, -1));
}

std::optional<WorkerProcess> startWorker(const WorkerCommand& command) {
    std::array<int, 2> ends{};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0) return {};
    Descriptor ours(ends[0]);
    const Descriptor theirs(ends[1]);
    const auto environment = environmentWith(command.environment);
    const auto argumentPointers = pointersTo(command.arguments);
    const auto environmentPointers = pointersTo(environment);

    const pid_t parent = getpid();
    const pid_t pid = fork();
    if (pid < 0) return {};
    if (pid == 0) become(theirs.get(), parent, argumentPointers.data(), environmentPointers.data());
    Descriptor handle(openProcess(pid));
    if (handle.get() < 0) {
        kill(pid, SIGKILL);
        reap(pid);
        return {};
    }
    return WorkerProcess{pid, std::move(handle), std::move(ours)};
}

WorkerGraveyard::~WorkerGraveyard() {
    for (const Grave& grave : _graves) {
        kill(grave.pid, SIGKILL);
        reap(grave.pid);
    }
}

void WorkerGraveyard::bury(WorkerProcess process) {
    kill(process.pid, SIGKILL);
    wait(std::move(process));
}

void WorkerGraveyard::letLeave(WorkerProcess process) { wait(std::move(process)); }

void WorkerGraveyard::wait(WorkerProcess process) {
    process.socket.close();
    const auto grave =
        _graves.insert(_graves.end(), Grave{process.pid, std::move(process.handle), nullptr});
    grave->ended = callWhenReadable(_event, grave->handle.get(), [this, grave] {
        reap(grave->pid);
        _graves.erase(grave);
    });
}

}  // namespace vlm::service
