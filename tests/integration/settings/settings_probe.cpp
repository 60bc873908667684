// Asks libvlm for one setting:
//
//     settings_probe KEY               the setting
//     settings_probe KEY USER          the setting for that user; for nobody when it is empty
//
// Prints its value, its origin, the milliseconds of work that the answer took and the most memory
// that the program held meanwhile, in MiB.

#include <sys/resource.h>

#include <ctime>
#include <iostream>
#include <optional>
#include <string_view>

#include "settings/smartcard_settings.h"

namespace {

using vlm::platform::String;

constexpr const char* kOrigins[] = {"managed", "machine", "default"};

// A busy machine makes a test wait, but does not make the program work.
long workInMilliseconds() { return std::clock() * 1000 / CLOCKS_PER_SEC; }

std::optional<String> nameFrom(std::string_view argument) {
    if (argument.empty()) return std::nullopt;
    return String(argument);
}

}  // namespace

int main(int argc, char* argv[]) {
    if (argc < 2) return 2;
    const long before = workInMilliseconds();
    const auto value = argc > 2 ? VLGetSmartcardSettingForUser(argv[1], nameFrom(argv[2]))
                                : VLGetSmartcardSetting(argv[1]);
    const long took = workInMilliseconds() - before;
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);

    std::cout << value << ' '
              << kOrigins[static_cast<std::size_t>(VLGetSmartcardSettingOrigin(argv[1]))] << ' '
              << took << ' ' << usage.ru_maxrss / 1024 << '\n';
    return 0;
}
