#include "services/vlmctl/commands.h"

#include "services/vlmctl/exit_status.h"

namespace vlm::control {

namespace {

int runCommand(const Arguments& arguments, Output& output) {
    switch (arguments.command) {
        case Command::Settings:
            return listSettings(arguments, output);
        case Command::Get:
            return getSetting(arguments, output);
        case Command::Set:
            return setSetting(arguments, output);
        case Command::Unset:
            return unsetSetting(arguments, output);
        case Command::Check:
            return checkFile(arguments, output);
        case Command::Tokens:
            return listTokens(arguments, output);
        case Command::Pairings:
            return listPairings(arguments, output);
        case Command::Doctor:
            return examine(arguments, output);
    }
    return kExitUsage;
}

// Help goes to standard output and ends in a line feed of its own; a refusal goes to the other.
int tell(const ParsedArguments& parsed, Output& output) {
    if (parsed.exitStatus == kExitSuccess) {
        output.print(std::string_view(parsed.text).substr(0, parsed.text.size() - 1));
    } else {
        output.complain(parsed.text);
    }
    return parsed.exitStatus;
}

}  // namespace

int runCommandLine(const std::vector<std::string>& words, Output& output) {
    const auto parsed = parseArguments(words);
    const int status =
        parsed.arguments ? runCommand(*parsed.arguments, output) : tell(parsed, output);
    if (!output.flush() && status == kExitSuccess) return kExitFailure;
    return status;
}

}  // namespace vlm::control
