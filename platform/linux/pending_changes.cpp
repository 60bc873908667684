#include "platform/linux/pending_changes.h"

#include <algorithm>

namespace vlm::platform {

namespace {

const PreferencesChange* findChange(const std::vector<PreferencesChange>& changes,
                                    std::string_view key) {
    const auto found = std::ranges::find(changes, key, &PreferencesChange::key);
    return found == changes.end() ? nullptr : &*found;
}

}  // namespace

void PendingChanges::set(std::string_view key, const std::optional<PropertyList>& value) {
    auto place = std::ranges::find(_changes, key, &PreferencesChange::key);
    if (place == _changes.end()) {
        _changes.push_back({std::string(key), value, ++_count});
    } else {
        place->value = value;
        place->number = ++_count;
    }
}

const PreferencesChange* PendingChanges::find(std::string_view key) const {
    return findChange(_changes, key);
}

void PendingChanges::forget(const std::vector<PreferencesChange>& taken) {
    std::erase_if(_changes, [&](const PreferencesChange& each) {
        const auto* same = findChange(taken, each.key);
        return same && same->number == each.number;
    });
}

PropertyList::Dictionary changed(const PropertyList::Dictionary& entries,
                                 const std::vector<PreferencesChange>& changes) {
    PropertyList::Dictionary result;
    for (const auto& [key, value] : entries) {
        const auto* change = findChange(changes, key);
        if (!change) {
            result.append(key, value);
        } else if (change->value) {
            result.append(key, *change->value);
        }
    }
    for (const auto& each : changes)
        if (each.value && !entries.contains(each.key)) result.append(each.key, *each.value);
    return result;
}

}  // namespace vlm::platform
