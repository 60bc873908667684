// The command line of vlmctl.
//
// In tests: tests/unit/vlmctl/arguments_test.cpp

#pragma once

#include <optional>
#include <string>
#include <vector>

namespace vlm::control {

enum class Command { Settings, Get, Set, Unset, Check, Tokens, Pairings, Doctor };

struct Arguments {
    Command command = Command::Settings;
    std::vector<std::string> operands;    // as many as the command wants
    std::optional<std::string> user;      // whom it is about
    std::optional<std::string> database;  // the file to read the pairings from
    std::optional<std::string> root;      // the folder whose files are looked at
    bool json = false;
    bool legend = true;  // headings above tables
};

// The arguments; or none, with what to print and how to end.
struct ParsedArguments {
    std::optional<Arguments> arguments;
    std::string text;
    int exitStatus = 0;
};

// Options may stand before, between and behind the other words; "--" ends them.
ParsedArguments parseArguments(const std::vector<std::string>& words);

}  // namespace vlm::control
