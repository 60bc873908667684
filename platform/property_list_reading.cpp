#include "platform/property_list_reading.h"

#include <algorithm>
#include <numeric>

namespace vlm::platform {

// Found by sorting, since a table of hashes would have its worst case chosen by whoever made the
// input.
PropertyList dictionaryOf(PropertyListEntries entries) {
    std::vector<std::size_t> order(entries.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::ranges::sort(order, [&](std::size_t left, std::size_t right) {
        const int difference = entries[left].first.compare(entries[right].first);
        return difference != 0 ? difference < 0 : left < right;
    });

    std::vector<bool> repeats(entries.size());
    for (std::size_t first = 0, at = 1; at < order.size(); ++at) {
        if (entries[order[at]].first != entries[order[first]].first) {
            first = at;
            continue;
        }
        entries[order[first]].second = std::move(entries[order[at]].second);
        repeats[order[at]] = true;
    }

    PropertyList::Dictionary dictionary;
    for (std::size_t at = 0; at < entries.size(); ++at)
        if (!repeats[at])
            dictionary.append(std::move(entries[at].first), std::move(entries[at].second));
    return dictionary;
}

std::string quotedForPerson(std::string_view input) {
    constexpr std::size_t kLongest = 40;
    std::string quoted = "\"";
    for (const char character : input.substr(0, kLongest))
        quoted += character >= ' ' && character <= '~' ? character : '?';
    quoted += input.size() > kLongest ? "...\"" : "\"";
    return quoted;
}

}  // namespace vlm::platform
