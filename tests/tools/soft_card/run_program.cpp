#include <fcntl.h>
#include <gtest/gtest.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <memory>

#include "tests/tools/soft_card/soft_cards.h"

namespace vlm::tests {
namespace {

struct FileClose {
    void operator()(std::FILE* file) const { static_cast<void>(std::fclose(file)); }
};
using File = std::unique_ptr<std::FILE, FileClose>;

// Unnamed files instead of pipes: no side can wait for the other.
File fileWith(const std::string& content) {
    File file(std::tmpfile());
    if (!file) return file;
    if (std::fwrite(content.data(), 1, content.size(), file.get()) != content.size())
        return nullptr;
    std::rewind(file.get());
    return file;
}

std::string contentOf(const File& file) {
    std::string content;
    std::rewind(file.get());
    char chunk[4096];
    while (const std::size_t size = std::fread(chunk, 1, sizeof chunk, file.get()))
        content.append(chunk, size);
    return content;
}

std::vector<char*> pointersTo(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    for (std::string& text : texts) pointers.push_back(text.data());
    pointers.push_back(nullptr);
    return pointers;
}

}  // namespace

ProgramResult runProgram(const std::vector<std::string>& arguments,
                         const std::vector<std::string>& environment, const std::string& input) {
    const File in = fileWith(input);
    const File out = fileWith({});
    const File err = fileWith({});
    if (!in || !out || !err) return {-1, {}, "no temporary file can be made"};

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, fileno(in.get()), STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, fileno(out.get()), STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, fileno(err.get()), STDERR_FILENO);
    auto argumentCopies = arguments;
    auto environmentCopies = environment;
    pid_t child = 0;
    const int failure =
        posix_spawnp(&child, arguments.front().c_str(), &actions, nullptr,
                     pointersTo(argumentCopies).data(), pointersTo(environmentCopies).data());
    posix_spawn_file_actions_destroy(&actions);
    if (failure != 0) return {127, {}, arguments.front() + " cannot be run"};

    int status = 0;
    waitpid(child, &status, 0);
    return {WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status), contentOf(out),
            contentOf(err)};
}

}  // namespace vlm::tests
