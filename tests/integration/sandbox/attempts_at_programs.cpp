#include <fcntl.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/sendfile.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <thread>

#include "attempts.h"

namespace vlm::test {

namespace {

constexpr const char* kProgram = "/usr/bin/true";
char programName[] = "true";
char* const kProgramArguments[] = {programName, nullptr};
char* const kNoEnvironment[] = {nullptr};

int execFromMemory() {
    const int program = open(kProgram, O_RDONLY | O_CLOEXEC);
    const int memory = memfd_create("program", MFD_CLOEXEC);
    struct stat status {};
    if (program < 0 || memory < 0 || fstat(program, &status) != 0) return errno;
    if (sendfile(memory, program, nullptr, static_cast<std::size_t>(status.st_size)) < 0)
        return errno;
    syscall(SYS_execveat, memory, "", kProgramArguments, kNoEnvironment, AT_EMPTY_PATH);
    return errno;
}

int spawn() {
    pid_t child = 0;
    const int error =
        posix_spawn(&child, kProgram, nullptr, nullptr, kProgramArguments, kNoEnvironment);
    if (error == 0) waitpid(child, nullptr, 0);
    return error;
}

// The C library says with status 127 that it could not start the shell.
int throughShell() {
    const int status = system("exit 0");  // NOLINT(cert-env33-c): this is the subject
    if (status < 0) return errno;
    return WEXITSTATUS(status) == 127 ? EPERM : WEXITSTATUS(status);
}

int inThread(Arguments arguments) {
    int error = 0;
    std::thread([&] { error = attempt(arguments); }).join();
    return error;
}

int inChild(Arguments arguments) {
    const pid_t child = fork();
    if (child < 0) return errno;
    if (child == 0) _exit(attempt(arguments));
    int status = 0;
    waitpid(child, &status, 0);
    return WEXITSTATUS(status);
}

}  // namespace

int attemptPrograms(const std::string& name, Arguments arguments) {
    if (name == "execve") {
        execve(kProgram, kProgramArguments, kNoEnvironment);
        return errno;
    }
    if (name == "execve-from-memory") return execFromMemory();
    if (name == "posix_spawn") return spawn();
    if (name == "system") return throughShell();
    if (name == "in-thread") return inThread(arguments);
    if (name == "in-child") return inChild(arguments);
    return -1;
}

}  // namespace vlm::test
