// The options of the command line, and the POSIX option parser that reads them.

#pragma once

#include <optional>
#include <string>

#include "platform/types.h"

namespace vlm {

// What the options parsed so far ask for; a later occurrence of an option replaces an earlier one.
struct Options {
    std::optional<std::string> userName;
    std::optional<platform::Bytes> publicKeyHash;
    std::optional<std::string> pairingUi;  // "status", "enable" or "disable"
    bool pair = false;
    bool unpair = false;
    bool pairingUiCommand = false;
    bool verbose = false;
};

// One option as the parser found it.
struct Option {
    char letter = 0;       // '?' for one that the parser has complained about
    std::string argument;  // empty for an option that takes none
};

// Reads options one by one. The parser's state is the process's, so there is one reader at a
// time; a new one starts over.
class OptionReader {
public:
    OptionReader(int argc, char* argv[]);

    // None after the last option.
    std::optional<Option> next();

private:
    int _argc;
    char** _argv;
};

}  // namespace vlm
