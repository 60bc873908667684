#include "platform/property_list_reading.h"

#include "platform/harmless_text.h"
#include "platform/secret_hash.h"
#include "platform/seen_set.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

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

    PropertyListEntries distinct;
    distinct.reserve(entries.size());
    const SecretHash hashOf;
    SeenSet seen(entries.size());
    for (auto& entry : entries) {
        const std::string& key = entry.first;
        const auto next = static_cast<std::uint32_t>(distinct.size());
        const auto first = seen.findOrAdd(
            hashOf(key), next, [&](std::uint32_t other) { return distinct[other].first == key; });
        if (first == next)
            distinct.push_back(std::move(entry));
        else
            distinct[first].second = std::move(entry.second);
    }
    return PropertyList::Dictionary::ofDistinct(std::move(distinct));
}

std::string quotedForPerson(std::string_view input) {
    constexpr std::size_t kLongest = 40;
    return text("\"{}\"", harmlessText(input, kLongest));
}

}  // namespace vlm::platform
