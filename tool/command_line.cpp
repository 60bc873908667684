#include "tool/command_line.h"

#include <optional>
#include <string>

#include "platform/utf.h"
#include "tool/dialog_control.h"
#include "tool/exit_status.h"
#include "tool/identity_listing.h"
#include "tool/options.h"
#include "tool/pairing_commands.h"
#include "tool/privileges.h"
#include "util/bind_utils.h"

namespace vlm {

namespace {

class CommandLine {
public:
    CommandLine(int argc, char* argv[], Console& console)
        : _reader(argc, argv), _console(console) {}

    int run();

private:
    // What ends the run before the last option: a refusal, or a command that does not wait.
    using Ending = std::optional<int>;

    Ending act(const Option& option);
    Ending takeUserName(const std::string& argument);
    Ending takePublicKeyHash(const std::string& argument);
    Ending takePairingUi(const std::string& argument);
    Ending takePair();
    Ending list();
    Ending refuse(const char* line);
    int runCommand();

    OptionReader _reader;
    Options _options;
    Console& _console;
};

int CommandLine::run() {
    while (const auto option = _reader.next())
        if (const auto ending = act(*option)) return *ending;
    return runCommand();
}

CommandLine::Ending CommandLine::act(const Option& option) {
    switch (option.letter) {
        case 'u':
            return takeUserName(option.argument);
        case 'h':
            return takePublicKeyHash(option.argument);
        case 's':
            return takePairingUi(option.argument);
        case 'p':
            return takePair();
        case 'i':
            return list();
        case 'r':
            _options.unpair = true;
            break;
        case 'v':
            _options.verbose = true;
            break;
        case 'f':
            forceBindUi(_console);
            break;
        default:
            break;  // the parser has complained, and that is all
    }
    return std::nullopt;
}

CommandLine::Ending CommandLine::takeUserName(const std::string& argument) {
    // A leading dash is an option whose predecessor lacks its argument.
    if (argument.empty() || argument.front() == '-' || !platform::utf8ToUtf16(argument))
        return refuse("Invalid user name specified.");
    _options.userName = argument;
    BindUtils::log().debug("entered command line user: {}", _options.userName);
    return std::nullopt;
}

CommandLine::Ending CommandLine::takePublicKeyHash(const std::string& argument) {
    auto hash = BindUtils::dataFromHex(argument);
    if (!hash || hash->empty()) return refuse("Invalid public key hash specified.");
    _options.publicKeyHash = std::move(hash);
    BindUtils::log().debug("entered command line pubkey hash: {}",
                           BindUtils::dataToHex(_options.publicKeyHash));
    return std::nullopt;
}

CommandLine::Ending CommandLine::takePairingUi(const std::string& argument) {
    if (!checkNoRoot(_console)) return kExitFailure;
    if (argument != "status" && argument != "enable" && argument != "disable")
        return refuse("Invalid option argument specified.");
    _options.pairingUi = argument;
    _options.pairingUiCommand = true;
    BindUtils::log().debug("entered command line pairing ui: {}", _options.pairingUi);
    return std::nullopt;
}

CommandLine::Ending CommandLine::takePair() {
    _options.pair = true;
    if (!checkRoot(_console)) return kExitFailure;
    return std::nullopt;
}

// Listing is the end of the run. The option behind it is taken from the parser and dropped, so
// that the parser's complaint about a wrong one is still seen.
CommandLine::Ending CommandLine::list() {
    _reader.next();
    return listIdentities(_console);
}

CommandLine::Ending CommandLine::refuse(const char* line) {
    _console.print(line);
    return kExitFailure;
}

int CommandLine::runCommand() {
    if (_options.pair) return runPair(_options, _console);
    if (_options.unpair) return runUnpair(_options, _console);
    if (_options.pairingUiCommand) return runPairingUiCommand(_options, _console);
    BindUtils::log().debug("unknown command line argument, exiting");
    return kExitFailure;
}

}  // namespace

int runCommandLine(int argc, char* argv[], Console& console) {
    BindUtils::log().debug("using command line arguments");
    const int status = CommandLine(argc, argv, console).run();
    if (!console.flush()) return kExitFailure;
    if (status == kExitSuccess) BindUtils::log().debug("exiting");
    return status;
}

}  // namespace vlm
