#include "services/vlmctl/known_key.h"

#include <algorithm>
#include <cctype>
#include <numeric>
#include <utility>
#include <vector>

#include "platform/text.h"

namespace vlm::control {

namespace {

// What is longer than any key could be with some letters too many is like none of them, and is not
// worth the time to compare.
constexpr std::size_t kLongest = 64;

char lower(char letter) {
    return static_cast<char>(std::tolower(static_cast<unsigned char>(letter)));
}

// How many letters have to be put in, left out or changed, whatever their case.
std::size_t distance(std::string_view from, std::string_view to) {
    std::vector<std::size_t> row(to.size() + 1);
    std::iota(row.begin(), row.end(), std::size_t{0});
    for (std::size_t i = 0; i < from.size(); ++i) {
        std::size_t diagonal = std::exchange(row[0], i + 1);
        for (std::size_t j = 0; j < to.size(); ++j) {
            const std::size_t changed = diagonal + (lower(from[i]) == lower(to[j]) ? 0 : 1);
            diagonal = std::exchange(row[j + 1], std::min({changed, row[j] + 1, row[j + 1] + 1}));
        }
    }
    return row.back();
}

}  // namespace

const KnownSetting* findSetting(std::string_view key) {
    const auto found = std::ranges::find(kKnownSettings, key, &KnownSetting::key);
    return found == kKnownSettings.end() ? nullptr : &*found;
}

std::optional<std::string_view> nearestKey(std::string_view key) {
    if (key.size() > kLongest) return std::nullopt;
    std::optional<std::string_view> nearest;
    std::size_t least = 1 + key.size() / 3;
    const auto consider = [&](std::string_view known) {
        const std::size_t letters = distance(key, known);
        if (letters >= least) return;
        least = letters;
        nearest = known;
    };
    for (const auto& setting : kKnownSettings) consider(setting.key);
    consider(kAttributeMapping);
    return nearest;
}

std::string unknownKey(std::string_view key) {
    const auto nearest = nearestKey(key);
    if (nearest && findSetting(*nearest))
        return platform::text("there is no setting \"{}\"; did you mean \"{}\"?", key, *nearest);
    return platform::text("there is no setting \"{}\"; \"vlmctl settings\" lists them", key);
}

}  // namespace vlm::control
