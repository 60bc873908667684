#include "services/vlmctl/shown.h"

#include <array>
#include <ctime>

#include "platform/harmless_text.h"

namespace vlm::control {

std::string shown(std::string_view text) {
    return platform::harmlessText(text, platform::kAllCharacters);
}

std::string pointInTime(std::int64_t seconds) {
    const std::time_t time = seconds;
    std::tm parts = {};
    std::array<char, 64> text = {};
    if (!gmtime_r(&time, &parts)) return std::to_string(seconds);
    const auto size = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%SZ", &parts);
    return {text.data(), size};
}

}  // namespace vlm::control
