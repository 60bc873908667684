#include "services/hints/terminal.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <charconv>
#include <fstream>
#include <utility>

#include "platform/text.h"

namespace vlm::service {

namespace {

constexpr unsigned kVirtualConsoles = 4;  // also serial lines, from the 64th on
constexpr unsigned kFirstSerialLine = 64;
constexpr unsigned kPseudoTerminals = 136;

// Behind the program's name, which may hold anything, the terminal is the fifth field.
constexpr int kFieldsBeforeTerminal = 4;

}  // namespace

dev_t terminalNumber(std::string_view stat) {
    const auto name = stat.rfind(") ");
    if (name == std::string_view::npos) return 0;
    stat.remove_prefix(name + 2);
    for (int field = 0; field < kFieldsBeforeTerminal; ++field) {
        const auto blank = stat.find(' ');
        if (blank == std::string_view::npos) return 0;
        stat.remove_prefix(blank + 1);
    }
    int number = 0;
    std::from_chars(stat.data(), stat.data() + stat.size(), number);
    // The kernel's own packing: the minor number's high bits stand above the major number.
    const auto packed = static_cast<unsigned>(number);
    return makedev((packed >> 8U) & 0xFFFU, (packed & 0xFFU) | ((packed >> 12U) & 0xFFF00U));
}

std::optional<std::string> terminalPath(dev_t number) {
    const auto minorNumber = minor(number);
    if (major(number) == kPseudoTerminals) return platform::text("/dev/pts/{}", minorNumber);
    if (major(number) != kVirtualConsoles || minorNumber == 0) return std::nullopt;
    if (minorNumber < kFirstSerialLine) return platform::text("/dev/tty{}", minorNumber);
    return platform::text("/dev/ttyS{}", minorNumber - kFirstSerialLine);
}

std::optional<Terminal> Terminal::of(const Caller& caller) {
    if (caller.process <= 0) return std::nullopt;
    std::ifstream file(platform::text("/proc/{}/stat", caller.process));
    std::string stat;
    std::getline(file, stat, '\0');  // a program's name may hold line ends
    const auto number = terminalNumber(stat);
    const auto path = terminalPath(number);
    if (!path) return std::nullopt;

    platform::FileDescriptor opened(
        open(path->c_str(), O_RDWR | O_NOCTTY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    struct stat state = {};
    termios settings = {};
    if (!opened || fstat(opened.get(), &state) != 0 || !S_ISCHR(state.st_mode) ||
        state.st_rdev != number || tcgetattr(opened.get(), &settings) != 0)
        return std::nullopt;
    if (!caller.isRoot() && state.st_uid != caller.user) return std::nullopt;
    return Terminal(*path, std::move(opened), settings);
}

std::string Terminal::type() const { return _path.starts_with("/dev/tty") ? "linux" : "xterm"; }

void Terminal::restore() const { tcsetattr(_file.get(), TCSANOW, &_settings); }

}  // namespace vlm::service
