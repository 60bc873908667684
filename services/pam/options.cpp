#include "services/pam/options.h"

#include <charconv>
#include <optional>
#include <string_view>

namespace vlm::pam {

namespace {

constexpr long kMostSeconds = 600;

std::optional<std::chrono::seconds> secondsIn(std::string_view text) {
    long seconds = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), seconds);
    if (error != std::errc() || end != text.data() + text.size()) return std::nullopt;
    if (seconds < 1 || seconds > kMostSeconds) return std::nullopt;
    return std::chrono::seconds(seconds);
}

bool readWord(std::string_view word, Options& options) {
    constexpr std::string_view kTimeout = "timeout=";
    constexpr std::string_view kBus = "bus=";
    if (word == "debug") return options.isDebugging = true;
    if (word.starts_with(kTimeout)) {
        const auto patience = secondsIn(word.substr(kTimeout.size()));
        options.patience = patience.value_or(options.patience);
        return patience.has_value();
    }
    if (!word.starts_with(kBus) || word.size() == kBus.size()) return false;
    options.bus = word.substr(kBus.size());
    return true;
}

}  // namespace

Options readOptions(int count, const char* const* words) {
    Options options;
    for (int each = 0; each < count; ++each)
        if (!readWord(words[each], options)) options.notUnderstood.emplace_back(words[each]);
    return options;
}

}  // namespace vlm::pam
