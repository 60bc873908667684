#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <vector>

namespace vlm::service {

enum class Instance { System, User };

struct Options {
    Instance instance = Instance::System;
    std::string database;      // absolute path
    std::string pinentry;      // empty for the machine's usual program
    std::string worker;        // empty for the one beside this program
    std::string moduleFolder;  // empty for the machine's own list of card modules
    std::chrono::milliseconds idleTime{120'000};  // quiet for so long, the daemon leaves; 0: never
};

// Either options to run with, or a text to print and the exit status to end with.
struct ParsedOptions {
    std::optional<Options> options;
    std::string text;
    int exitStatus = 0;
};

ParsedOptions parseOptions(const std::vector<std::string>& arguments);

}  // namespace vlm::service
