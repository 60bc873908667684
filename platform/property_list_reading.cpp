#include "platform/property_list_reading.h"

#include <algorithm>
#include <numeric>

#include "platform/property_list_index.h"

namespace vlm::platform {

namespace {

// For each entry the first one with its key; nothing when looking for it takes too long.
std::optional<std::vector<std::uint32_t>> firstsByHash(const PropertyListEntries& entries) {
    PropertyListIndex index(entries.size());
    std::vector<std::uint32_t> firsts(entries.size());
    for (std::uint32_t at = 0; at < firsts.size(); ++at) {
        const std::string& key = entries[at].first;
        const auto first = index.findOrAdd(
            hashOf(key), at, [&](std::uint32_t other) { return entries[other].first == key; });
        if (!first) return std::nullopt;
        firsts[at] = *first;
    }
    return firsts;
}

// Slower, but no input can make it worse.
std::vector<std::uint32_t> firstsBySorting(const PropertyListEntries& entries) {
    std::vector<std::uint32_t> order(entries.size());
    std::iota(order.begin(), order.end(), std::uint32_t{0});
    std::ranges::stable_sort(
        order, {}, [&](std::uint32_t at) -> const std::string& { return entries[at].first; });
    std::vector<std::uint32_t> firsts(entries.size());
    for (std::size_t at = 0; at < order.size(); ++at) {
        const bool isNew = at == 0 || entries[order[at]].first != entries[order[at - 1]].first;
        firsts[order[at]] = isNew ? order[at] : firsts[order[at - 1]];
    }
    return firsts;
}

// Whether all keys of a dictionary that is short enough for comparing each with each differ.
bool isShortWithoutRepetition(const PropertyListEntries& entries) {
    constexpr std::size_t kShort = 8;
    if (entries.size() > kShort) return false;
    for (auto entry = entries.begin(); entry != entries.end(); ++entry)
        for (auto before = entries.begin(); before != entry; ++before)
            if (before->first == entry->first) return false;
    return true;
}

}  // namespace

PropertyList dictionaryOf(PropertyListEntries entries) {
    if (isShortWithoutRepetition(entries))
        return PropertyList::Dictionary::ofDistinct(std::move(entries));

    auto firsts = firstsByHash(entries);
    if (!firsts) firsts = firstsBySorting(entries);
    for (std::size_t at = 0; at < entries.size(); ++at)
        if ((*firsts)[at] != at) entries[(*firsts)[at]].second = std::move(entries[at].second);

    std::size_t kept = 0;
    for (std::size_t at = 0; at < entries.size(); ++at) {
        if ((*firsts)[at] != at) continue;
        if (kept != at) entries[kept] = std::move(entries[at]);
        ++kept;
    }
    entries.erase(entries.begin() + static_cast<std::ptrdiff_t>(kept), entries.end());
    return PropertyList::Dictionary::ofDistinct(std::move(entries));
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
