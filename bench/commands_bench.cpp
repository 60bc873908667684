// How long commands take from start to exit, against a program that does nothing. Commands of a
// user are run as a user without rights when this is run as root.
//
//   commands_bench VLMBIND EMPTY-PROGRAM

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "bench/interleaved.h"
#include "bench/temporary_folder.h"

namespace vlm::bench {
namespace {

constexpr uid_t kNobody = 65534;

[[noreturn]] void becomeUserAndRun(std::vector<std::string> arguments, const std::string& home) {
    const int nothing = open("/dev/null", O_RDWR);
    dup2(nothing, STDIN_FILENO);
    dup2(nothing, STDOUT_FILENO);
    dup2(nothing, STDERR_FILENO);
    if (getuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) _exit(126);
    setenv("HOME", home.c_str(), 1);
    for (const char* name : {"XDG_CONFIG_HOME", "XDG_CACHE_HOME", "XDG_RUNTIME_DIR"})
        unsetenv(name);
    std::vector<char*> pointers;
    for (std::string& argument : arguments) pointers.push_back(argument.data());
    pointers.push_back(nullptr);
    execv(pointers[0], pointers.data());
    _exit(127);
}

void run(const std::vector<std::string>& arguments, int expectedStatus, const std::string& home) {
    const pid_t child = fork();
    if (child == 0) becomeUserAndRun(arguments, home);
    int status = 0;
    if (child < 0 || waitpid(child, &status, 0) != child || !WIFEXITED(status) ||
        WEXITSTATUS(status) != expectedStatus) {
        std::printf("%s did not end with %d\n", arguments[0].c_str(), expectedStatus);
        std::exit(2);
    }
}

bool measure(const std::string& vlmbind, const std::string& emptyProgram) {
    const TemporaryFolder home;
    if (getuid() == 0 && chown(home.path().c_str(), kNobody, kNobody) != 0) std::exit(2);
    const auto command = [&](std::vector<std::string> arguments, int status) {
        return [=, folder = home.path().string()] { run(arguments, status, folder); };
    };
    const auto time = medianTimes(
        {
            {"empty", command({emptyProgram}, 0)},
            {"refused", command({vlmbind, "-p"}, 255)},
            {"status", command({vlmbind, "-s", "status"}, 0)},
        },
        400, Clock::Wall);
    const bool refuses = report("vlmbind -p, refused", time[1], "an empty program", time[0], 2);
    const bool tells = report("vlmbind -s status", time[2], "an empty program", time[0], 2);
    return refuses && tells;
}

}  // namespace
}  // namespace vlm::bench

int main(int argc, char* argv[]) {
    if (argc != 3) {
        std::fprintf(stderr, "usage: commands_bench VLMBIND EMPTY-PROGRAM\n");
        return 2;
    }
    return vlm::bench::measure(argv[1], argv[2]) ? 0 : 1;
}
