// Pty: a terminal with a program on it, as a person has it in a window.

#pragma once

#include <sys/types.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"

namespace vlm::test {

class Pty {
public:
    // The program has the terminal as its own; the environment and the user are as for a Child.
    Pty(const std::vector<std::string>& arguments, const Child::Options& options);
    ~Pty();
    Pty(const Pty&) = delete;
    Pty& operator=(const Pty&) = delete;

    const std::string& path() const { return _path; }  // as in /dev/pts/3
    void type(const std::string& keys);

    // Whether the text is seen on the terminal before the patience is over.
    bool waitFor(const std::string& text);
    const std::string& seen() const { return _seen; }

    bool echoes() const;
    void kill();

private:
    int _screen = -1;
    int _terminal = -1;
    pid_t _pid = -1;
    std::string _path;
    std::string _seen;
};

}  // namespace vlm::test
