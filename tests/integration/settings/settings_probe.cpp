// Asks libvlm for one setting:
//
//     settings_probe KEY               the setting
//     settings_probe KEY USER          the setting for that user; for nobody when it is empty
//
// Prints its value, its origin, the milliseconds that the answer took and the most memory that the
// program held meanwhile, in MiB.

#include <sys/resource.h>

#include <chrono>
#include <iostream>
#include <optional>
#include <string_view>

#include "settings/smartcard_settings.h"

namespace {

using vlm::platform::String;

constexpr const char* kOrigins[] = {"managed", "machine", "default"};

std::optional<String> nameFrom(std::string_view argument) {
    if (argument.empty()) return std::nullopt;
    return String(argument);
}

}  // namespace

int main(int argc, char* argv[]) {
    using namespace std::chrono;
    if (argc < 2) return 2;
    const auto start = steady_clock::now();
    const auto value = argc > 2 ? VLGetSmartcardSettingForUser(argv[1], nameFrom(argv[2]))
                                : VLGetSmartcardSetting(argv[1]);
    const auto took = duration_cast<milliseconds>(steady_clock::now() - start);
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);

    std::cout << value << ' '
              << kOrigins[static_cast<std::size_t>(VLGetSmartcardSettingOrigin(argv[1]))] << ' '
              << took.count() << ' ' << usage.ru_maxrss / 1024 << '\n';
    return 0;
}
