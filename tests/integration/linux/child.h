// Child: a program that a test runs, with its standard streams in the test's hands.
//
// The child leads a process group of its own. That group is killed with the object; the child also
// when the thread that started it ends, so a test that is stopped from outside leaves nothing
// behind.
//
// Threads: one at a time. Errors: the constructor throws when the program cannot be started.

#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vlm::test {

class Child {
public:
    // Set on top of the test's own environment; none takes a variable away.
    using Environment = std::map<std::string, std::optional<std::string>>;

    struct Options {
        Environment environment{};
        std::optional<uid_t> user{};  // user and group id to run as; the caller must be root
    };
    static constexpr std::chrono::milliseconds kPatience = std::chrono::seconds(60);

    // The program, looked for in PATH when it has no slash, and its arguments.
    explicit Child(std::vector<std::string> arguments) : Child(std::move(arguments), Options()) {}
    Child(std::vector<std::string> arguments, const Options& options);
    ~Child();
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    pid_t pid() const { return _pid; }

    // Standard input; a child that no longer reads gets nothing.
    void write(const std::string& text);
    void closeInput();

    // Sends a signal to the child alone.
    void signal(int number) const;

    // The exit status, or 128 and the signal that killed it; none when the time is over before.
    std::optional<int> wait(std::chrono::milliseconds patience = kPatience);

    // Whether the text comes on standard output (standard error) before the time is over or the
    // stream ends.
    bool waitForOutput(const std::string& text, std::chrono::milliseconds patience = kPatience);
    bool waitForErrors(const std::string& text, std::chrono::milliseconds patience = kPatience);

    // What came so far; everything after wait().
    const std::string& output() const { return _output.text; }
    const std::string& errors() const { return _errors.text; }

private:
    struct Stream {
        int descriptor = -1;
        std::string text;
    };

    bool waitForText(const Stream& stream, const std::string& text,
                     std::chrono::milliseconds patience);
    bool pump(std::chrono::steady_clock::time_point deadline, bool untilEnd);
    static void drain(Stream& stream);

    pid_t _pid = -1;
    int _processDescriptor = -1;
    int _input = -1;
    Stream _output;
    Stream _errors;
    std::optional<int> _status;
};

// Waits until it is so, as long as a child may take.
bool eventually(const std::function<bool()>& isSo);

// Runs a program to its end with this on its standard input.
struct Ended {
    std::optional<int> status;  // none when it took too long and was killed
    std::string output;
    std::string errors;
};
Ended run(std::vector<std::string> arguments, const Child::Options& options = {},
          const std::string& input = "");

}  // namespace vlm::test
