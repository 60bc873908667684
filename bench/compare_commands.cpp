// How long commands take, side by side, from start to exit.
//
//   compare_commands TURNS <COMMANDS
//
// A line of COMMANDS has tabs between: a name, what is typed to the command and the command's
// words. A command that fails ends the measurement. Prints for each, with tabs between: its name,
// and the median and the 95th percentile of its time in milliseconds.

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <string>
#include <vector>

#include "bench/interleaved.h"

namespace vlm::bench {
namespace {

struct Command {
    std::string name;
    std::string typed;
    std::vector<std::string> words;
};

std::vector<std::string> split(const std::string& line) {
    std::vector<std::string> fields(1);
    for (const char c : line) {
        if (c == '\t')
            fields.emplace_back();
        else
            fields.back() += c;
    }
    return fields;
}

[[noreturn]] void fail(const std::string& why) {
    std::cerr << "compare_commands: " << why << '\n';
    std::exit(2);
}

void run(const Command& command) {
    std::array<int, 2> input{};
    if (pipe2(input.data(), O_CLOEXEC) != 0) fail("no pipe");
    const auto typed = command.typed + "\n";
    if (write(input[1], typed.data(), typed.size()) < 0) fail("the pipe takes nothing");
    close(input[1]);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input[0], STDIN_FILENO);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    std::vector<std::string> words = command.words;
    std::vector<char*> arguments;
    for (auto& word : words) arguments.push_back(word.data());
    arguments.push_back(nullptr);
    pid_t child = 0;
    const int spawned =
        posix_spawnp(&child, arguments[0], &actions, nullptr, arguments.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    close(input[0]);
    int status = 0;
    if (spawned != 0 || waitpid(child, &status, 0) != child || status != 0)
        fail(command.name + " failed");
}

}  // namespace
}  // namespace vlm::bench

int main(int argc, char* argv[]) {
    using namespace vlm::bench;
    if (argc != 2) fail("usage: compare_commands TURNS <COMMANDS");
    std::vector<Command> commands;
    for (std::string line; std::getline(std::cin, line);) {
        auto fields = split(line);
        if (fields.size() < 3) fail("not a command: " + line);
        commands.push_back({fields[0], fields[1], {fields.begin() + 2, fields.end()}});
    }
    std::vector<Work> pieces;
    for (const auto& command : commands)
        pieces.push_back({command.name, [&command] { run(command); }});
    const auto times = turns(pieces, std::strtoul(argv[1], nullptr, 10), Clock::Wall);
    for (std::size_t i = 0; i < commands.size(); ++i)
        std::printf("%s\t%.3f\t%.3f\n", commands[i].name.c_str(),
                    quantile(times[i], 0.5).count() * 1000,
                    quantile(times[i], 0.95).count() * 1000);
    return 0;
}
