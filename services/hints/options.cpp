#include "services/hints/options.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <string_view>

#include "platform/text.h"
#include "services/hints/sqlite_pairing_store.h"

namespace vlm::service {

namespace {

constexpr int kUsageError = 64;

constexpr std::string_view kHelp =
    R"(Usage: vlmhintsd --system [OPTION]...
       vlmhintsd --user [--pinentry PROGRAM]

The hints service knows the smart cards that are inserted and the accounts that
they are paired with.

  --system             serve the machine, on the system bus, as root
  --user               serve one user, on that user's session bus: pass requests
                       on to the machine's service, and ask for PINs on the desktop
  --database FILE      keep the pairings here
                       (default: {})
  --pinentry PROGRAM   ask for PINs with this program (default: pinentry)
  --worker PROGRAM     the program that card modules run in
                       (default: vlm-token-worker, beside this program)
  --modules FOLDER     read which card modules there are from this folder only
                       (default: the folders of pkcs11.conf(5))
  --idle-seconds N     end after so many seconds without work, fractions too; whoever
                       asks next starts the service again; 0 is never (default: {})
  --help               print this and end
  --version            print the version and end

All paths are absolute.
)";

struct PathOption {
    std::string_view name;
    std::string Options::*value;
    bool isForUserToo;
};

constexpr std::array kPathOptions = {
    PathOption{"--database", &Options::database, false},
    PathOption{"--pinentry", &Options::pinentry, true},
    PathOption{"--worker", &Options::worker, false},
    PathOption{"--modules", &Options::moduleFolder, false},
};

constexpr std::string_view kIdleOption = "--idle-seconds";
constexpr double kMostIdleSeconds = 86'400;

ParsedOptions wrong(std::string_view why) {
    return {std::nullopt, platform::text("vlmhintsd: {}. Try \"vlmhintsd --help\".\n", why),
            kUsageError};
}

std::optional<std::chrono::milliseconds> readIdleTime(const std::optional<std::string>& text) {
    if (!text) return std::nullopt;
    double seconds = NAN;
    const char* const end = text->data() + text->size();
    const auto read = std::from_chars(text->data(), end, seconds, std::chars_format::fixed);
    if (read.ec != std::errc() || read.ptr != end) return std::nullopt;
    if (!(seconds >= 0 && seconds <= kMostIdleSeconds)) return std::nullopt;
    // Upwards: a time that is short beyond measure is not "never".
    return std::chrono::ceil<std::chrono::milliseconds>(std::chrono::duration<double>(seconds));
}

std::string help() {
    const auto idleTime = std::chrono::floor<std::chrono::seconds>(Options().idleTime);
    return platform::text(kHelp, SqlitePairingStore::kUsualPath, idleTime.count());
}

// Takes "--name value" and "--name=value" off the head of the arguments.
class Arguments {
public:
    explicit Arguments(const std::vector<std::string>& arguments) : _arguments(arguments) {}

    bool isEmpty() const { return _at == _arguments.size(); }

    std::string takeName() {
        const auto& argument = _arguments[_at++];
        const auto sign = argument.find('=');
        if (!argument.starts_with("--") || sign == std::string::npos) return argument;
        _value = argument.substr(sign + 1);
        return argument.substr(0, sign);
    }

    std::optional<std::string> takeValue() {
        if (_value) return std::exchange(_value, std::nullopt);
        if (isEmpty()) return std::nullopt;
        return _arguments[_at++];
    }

    bool hasValue() const { return _value.has_value(); }

private:
    const std::vector<std::string>& _arguments;
    std::size_t _at = 0;
    std::optional<std::string> _value;
};

}  // namespace

ParsedOptions parseOptions(const std::vector<std::string>& given) {
    Options options;
    std::optional<Instance> instance;
    std::string_view systemOnly;
    Arguments arguments(given);
    while (!arguments.isEmpty()) {
        const auto name = arguments.takeName();
        const auto path = std::ranges::find(kPathOptions, name, &PathOption::name);
        if (path != kPathOptions.end()) {
            const auto value = arguments.takeValue();
            if (!value || !value->starts_with('/'))
                return wrong(platform::text("{} needs an absolute path", name));
            options.*(path->value) = *value;
            if (!path->isForUserToo) systemOnly = path->name;
            continue;
        }
        if (name == kIdleOption) {
            const auto time = readIdleTime(arguments.takeValue());
            if (!time)
                return wrong(
                    platform::text("{} needs a number of seconds from 0, which is never, "
                                   "to {}",
                                   kIdleOption, kMostIdleSeconds));
            options.idleTime = *time;
            systemOnly = kIdleOption;
            continue;
        }
        if (arguments.hasValue()) return wrong(platform::text("{} takes no value", name));
        if (name == "--help") return {std::nullopt, help(), 0};
        if (name == "--version") return {std::nullopt, "vlmhintsd " VLM_VERSION "\n", 0};
        if (name != "--system" && name != "--user")
            return wrong(platform::text("there is no option {}", name));
        if (instance) return wrong("--system or --user is given once");
        instance = name == "--system" ? Instance::System : Instance::User;
    }
    if (!instance) return wrong("--system or --user is needed");
    if (*instance == Instance::User && !systemOnly.empty())
        return wrong(platform::text("{} is for --system only", systemOnly));
    options.instance = *instance;
    if (options.database.empty()) options.database = SqlitePairingStore::kUsualPath;
    return {options, {}, 0};
}

}  // namespace vlm::service
