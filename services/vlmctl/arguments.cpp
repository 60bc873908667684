#include "services/vlmctl/arguments.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "platform/text.h"
#include "services/vlmctl/exit_status.h"

namespace vlm::control {

namespace {

constexpr std::string_view kHelp =
    R"(Usage: vlmctl [OPTION]... COMMAND

Look at and set what rules the smart cards of this machine.

Settings:
  settings             list every setting, its value and where that comes from
  get KEY              print the value of a setting
  set KEY VALUE        set a setting for this machine, as in "on"; root only
  unset KEY            remove a setting from this machine's record; root only
  check FILE           tell what is wrong in a property list; "-" is standard input

Cards:
  tokens               list the identities of the inserted cards
  pairings             list the paired identities: one's own, or for root all

Help:
  doctor               tell what keeps cards from working, and what to do

Options:
  -u, --user NAME      settings, get: what holds for this user, and why
                       pairings: those of this account
      --database FILE  pairings: read this database
      --root FOLDER    doctor: look at the files of a machine in this folder
      --json           print JSON
      --no-legend      print tables without headings
  -h, --help           print this and end
      --version        print the version and end

Exit status: 0 success; 1 failure, or what was checked has problems; 2 wrong
usage, or the file to check cannot be read.
)";

struct CommandRule {
    std::string_view name;
    Command command;
    std::string_view operands;  // their names, as a person is told them
    std::size_t operandCount;
    bool takesUser = false;
};

constexpr std::array kCommands = {
    CommandRule{"settings", Command::Settings, "nothing", 0, true},
    CommandRule{"get", Command::Get, "KEY", 1, true},
    CommandRule{"set", Command::Set, "KEY VALUE", 2},
    CommandRule{"unset", Command::Unset, "KEY", 1},
    CommandRule{"check", Command::Check, "FILE", 1},
    CommandRule{"tokens", Command::Tokens, "nothing", 0},
    CommandRule{"pairings", Command::Pairings, "nothing", 0, true},
    CommandRule{"doctor", Command::Doctor, "nothing", 0},
};

struct FlagOption {
    std::string_view name;
    bool Arguments::*place;
    bool value;
};

constexpr std::array kFlagOptions = {
    FlagOption{"--json", &Arguments::json, true},
    FlagOption{"--no-legend", &Arguments::legend, false},
};

struct ValueOption {
    std::string_view name;
    std::string_view letter;
    std::optional<std::string> Arguments::*place;
};

constexpr std::array kValueOptions = {
    ValueOption{"--user", "-u", &Arguments::user},
    ValueOption{"--database", "", &Arguments::database},
    ValueOption{"--root", "", &Arguments::root},
};

class Parser {
public:
    explicit Parser(const std::vector<std::string>& words) : _words(words) {}

    ParsedArguments parse() {
        while (!_end && _at < _words.size()) takeWord(_words[_at++]);
        if (!_end) checkCommand();
        if (_end) return *_end;
        return {_arguments, {}, kExitSuccess};
    }

private:
    void takeWord(const std::string& word) {
        if (_onlyOperands || word == "-" || !word.starts_with('-')) {
            _operands.push_back(word);
        } else if (word == "--") {
            _onlyOperands = true;
        } else if (word.starts_with("--")) {
            takeOption(word.substr(0, word.find('=')), valueBehind(word, word.find('=')));
        } else {
            takeOption(word.substr(0, 2), valueBehind(word, word.size() > 2 ? 1 : word.npos));
        }
    }

    static std::optional<std::string> valueBehind(const std::string& word, std::size_t before) {
        if (before == std::string::npos) return std::nullopt;
        return word.substr(before + 1);
    }

    void takeOption(const std::string& name, std::optional<std::string> value) {
        for (const auto& option : kValueOptions)
            if (name == option.name || name == option.letter)
                return takeValue(option, std::move(value));
        const auto flag = std::ranges::find(kFlagOptions, name, &FlagOption::name);
        const bool isKnown =
            flag != kFlagOptions.end() || name == "-h" || name == "--help" || name == "--version";
        if (!isKnown) return refuse(platform::text("there is no option {}", name));
        if (value) return refuse(platform::text("{} takes no value", name));
        if (flag != kFlagOptions.end()) {
            _arguments.*(flag->place) = flag->value;
        } else {
            end(name == "--version" ? "vlmctl " VLM_VERSION "\n" : kHelp, kExitSuccess);
        }
    }

    void takeValue(const ValueOption& option, std::optional<std::string> value) {
        if (!value && _at < _words.size()) value = _words[_at++];
        if (!value || value->empty())
            return refuse(platform::text("{} needs a value", option.name));
        _arguments.*(option.place) = std::move(value);
    }

    void checkCommand() {
        if (_operands.empty()) return refuse("a command is needed");
        const auto rule = std::ranges::find(kCommands, _operands.front(), &CommandRule::name);
        if (rule == kCommands.end())
            return refuse(platform::text("there is no command {}", _operands.front()));
        _operands.erase(_operands.begin());
        if (_operands.size() != rule->operandCount)
            return refuse(platform::text("{} takes {}", rule->name, rule->operands));
        if (_arguments.user && !rule->takesUser)
            return refuse(platform::text("{} takes no --user", rule->name));
        if (_arguments.database && rule->command != Command::Pairings)
            return refuse(platform::text("{} takes no --database", rule->name));
        if (_arguments.root && rule->command != Command::Doctor)
            return refuse(platform::text("{} takes no --root", rule->name));
        _arguments.command = rule->command;
        _arguments.operands = std::move(_operands);
    }

    void refuse(std::string_view why) {
        end(platform::text("{}. Try \"vlmctl --help\"", why), kExitUsage);
    }

    void end(std::string_view text, int exitStatus) {
        _end = ParsedArguments{std::nullopt, std::string(text), exitStatus};
    }

    const std::vector<std::string>& _words;
    std::size_t _at = 0;
    bool _onlyOperands = false;
    std::vector<std::string> _operands;
    Arguments _arguments;
    std::optional<ParsedArguments> _end;
};

}  // namespace

ParsedArguments parseArguments(const std::vector<std::string>& words) {
    return Parser(words).parse();
}

}  // namespace vlm::control
