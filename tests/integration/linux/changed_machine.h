// ChangedMachine: runs programs on this machine with some of its files and folders replaced, in a
// mount namespace that ends with the program.
//
// Threads: one at a time.

#pragma once

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"

namespace vlm::test {

class ChangedMachine {
public:
    // Why this machine does not let that be done; none when it does.
    static std::optional<std::string> unavailable();

    // The file (folder) that stands in the place of the machine's from the next program on.
    void replace(const std::filesystem::path& place, const std::filesystem::path& with) {
        _replacements[place] = with;
    }

    // The command line that runs the program there, as the superuser of the namespace.
    std::vector<std::string> commandLine(const std::vector<std::string>& program) const;

    Ended run(const std::vector<std::string>& program, const Child::Options& options = {}) const {
        return test::run(commandLine(program), options);
    }

private:
    std::map<std::filesystem::path, std::filesystem::path> _replacements;
};

}  // namespace vlm::test
