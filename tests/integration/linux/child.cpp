#include "tests/integration/linux/child.h"

#include <fcntl.h>
#include <grp.h>
#include <poll.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <system_error>
#include <thread>
#include <utility>

namespace vlm::test {

namespace {

[[noreturn]] void fail(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

struct Pipe {
    Pipe() {
        if (::pipe2(ends.data(), O_CLOEXEC) != 0) fail("pipe");
    }
    ~Pipe() {
        for (const int end : ends)
            if (end >= 0) ::close(end);
    }
    Pipe(const Pipe&) = delete;
    Pipe& operator=(const Pipe&) = delete;
    int take(std::size_t end) { return std::exchange(ends.at(end), -1); }
    std::array<int, 2> ends{-1, -1};
};

std::vector<std::string> environmentWith(const Child::Options& options) {
    std::vector<std::string> entries;
    for (char** entry = ::environ; *entry; ++entry) {
        const std::string text = *entry;
        if (!options.environment.contains(text.substr(0, text.find('=')))) entries.push_back(text);
    }
    for (const auto& [name, value] : options.environment)
        if (value) entries.push_back(name + "=" + *value);
    return entries;
}

std::vector<char*> pointers(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    for (auto& text : texts) pointers.push_back(text.data());
    pointers.push_back(nullptr);
    return pointers;
}

// Becomes the program. Between fork and exec only calls that are safe in a process with threads.
[[noreturn]] void become(const std::array<int, 3>& streams, int failure, pid_t parent,
                         const Child::Options& options, char* const* arguments,
                         char* const* environment) {
    ::setpgid(0, 0);
    bool ready = true;
    for (int stream = 0; stream < 3; ++stream)
        ready = ready && ::dup2(streams.at(static_cast<std::size_t>(stream)), stream) == stream;
    if (options.user)
        ready = ready && ::setgroups(0, nullptr) == 0 &&
                ::setresgid(*options.user, *options.user, *options.user) == 0 &&
                ::setresuid(*options.user, *options.user, *options.user) == 0;
    // After the change of user, which clears it; the parent may be gone before it is set.
    ready = ready && ::prctl(PR_SET_PDEATHSIG, SIGKILL) == 0;
    if (ready && ::getppid() == parent) ::execvpe(arguments[0], arguments, environment);
    const int reason = errno;
    [[maybe_unused]] const auto written = ::write(failure, &reason, sizeof reason);
    ::_exit(127);
}

}  // namespace

Child::Child(std::vector<std::string> arguments, const Options& options) {
    Pipe input, output, errors, failure;
    auto environment = environmentWith(options);
    const auto argumentPointers = pointers(arguments);
    const auto environmentPointers = pointers(environment);
    const pid_t parent = ::getpid();
    _pid = ::fork();
    if (_pid < 0) fail("fork");
    if (_pid == 0)
        become({input.ends[0], output.ends[1], errors.ends[1]}, failure.ends[1], parent, options,
               argumentPointers.data(), environmentPointers.data());
    ::close(failure.take(1));
    int reason = 0;
    if (::read(failure.ends[0], &reason, sizeof reason) == sizeof reason) {
        ::waitpid(_pid, nullptr, 0);
        errno = reason;
        fail(arguments.at(0));
    }
    _processDescriptor = static_cast<int>(::syscall(SYS_pidfd_open, _pid, 0));
    _input = input.take(1);
    _output.descriptor = output.take(0);
    _errors.descriptor = errors.take(0);
    for (const int descriptor : {_output.descriptor, _errors.descriptor})
        ::fcntl(descriptor, F_SETFL, O_NONBLOCK);
}

Child::~Child() {
    // The child is collected here only, so that its id is still its own when its group is killed.
    ::kill(-_pid, SIGKILL);
    ::waitpid(_pid, nullptr, 0);
    for (const int descriptor :
         {_input, _output.descriptor, _errors.descriptor, _processDescriptor})
        if (descriptor >= 0) ::close(descriptor);
}

void Child::write(const std::string& text) {
    sigset_t brokenPipe, before;
    sigemptyset(&brokenPipe);
    sigaddset(&brokenPipe, SIGPIPE);
    ::pthread_sigmask(SIG_BLOCK, &brokenPipe, &before);
    std::size_t done = 0;
    while (done < text.size()) {
        const auto written = ::write(_input, text.data() + done, text.size() - done);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) break;
        done += static_cast<std::size_t>(written);
    }
    const timespec now{};
    while (::sigtimedwait(&brokenPipe, nullptr, &now) > 0) {
    }
    ::pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

void Child::closeInput() {
    if (_input >= 0) ::close(std::exchange(_input, -1));
}

void Child::signal(int number) const {
    if (!_status) ::kill(_pid, number);
}

std::optional<int> Child::wait(std::chrono::milliseconds patience) {
    const auto deadline = std::chrono::steady_clock::now() + patience;
    while (!_status && pump(deadline, true)) {
    }
    return _status;
}

bool Child::waitForOutput(const std::string& text, std::chrono::milliseconds patience) {
    return waitForText(_output, text, patience);
}

bool Child::waitForErrors(const std::string& text, std::chrono::milliseconds patience) {
    return waitForText(_errors, text, patience);
}

bool Child::waitForText(const Stream& stream, const std::string& text,
                        std::chrono::milliseconds patience) {
    const auto deadline = std::chrono::steady_clock::now() + patience;
    const auto isThere = [&] { return stream.text.find(text) != std::string::npos; };
    while (!isThere() && stream.descriptor >= 0 && pump(deadline, false)) {
    }
    return isThere();
}

// Waits for the next thing to happen and takes it in; false when there is nothing left to wait for
// or the deadline has passed.
bool Child::pump(std::chrono::steady_clock::time_point deadline, bool untilEnd) {
    using std::chrono::ceil, std::chrono::milliseconds;
    const auto left = ceil<milliseconds>(deadline - std::chrono::steady_clock::now()).count();
    if (left <= 0) return false;
    std::array<pollfd, 3> waiting{{{_output.descriptor, POLLIN, 0},
                                   {_errors.descriptor, POLLIN, 0},
                                   {untilEnd ? _processDescriptor : -1, POLLIN, 0}}};
    if (::poll(waiting.data(), waiting.size(), static_cast<int>(left)) < 0) return errno == EINTR;
    drain(_output);
    drain(_errors);
    if (untilEnd && waiting[2].revents != 0) {
        siginfo_t ended{};
        ::waitid(P_PID, static_cast<id_t>(_pid), &ended, WEXITED | WNOWAIT);
        _status = ended.si_code == CLD_EXITED ? ended.si_status : 128 + ended.si_status;
        drain(_output);
        drain(_errors);
    }
    return true;
}

void Child::drain(Stream& stream) {
    std::array<char, 4096> buffer;
    while (stream.descriptor >= 0) {
        const auto count = ::read(stream.descriptor, buffer.data(), buffer.size());
        if (count > 0) {
            stream.text.append(buffer.data(), static_cast<std::size_t>(count));
        } else if (count == 0) {
            ::close(std::exchange(stream.descriptor, -1));
        } else if (errno != EINTR) {
            return;
        }
    }
}

bool eventually(const std::function<bool()>& isSo) {
    const auto deadline = std::chrono::steady_clock::now() + Child::kPatience;
    while (!isSo()) {
        if (std::chrono::steady_clock::now() > deadline) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return true;
}

Ended run(std::vector<std::string> arguments, const Child::Options& options,
          const std::string& input) {
    Child child(std::move(arguments), options);
    child.write(input);
    child.closeInput();
    const auto status = child.wait();
    return {status, child.output(), child.errors()};
}

}  // namespace vlm::test
