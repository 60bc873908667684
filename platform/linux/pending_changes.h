// PendingChanges: what was set in one record and is not on the disk yet.
//
// Threads: one at a time.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/property_list.h"

namespace vlm::platform {

struct PreferencesChange {
    std::string key;
    std::optional<PropertyList> value;  // none removes the key
    std::uint64_t number = 0;           // counted up with each change
};

class PendingChanges {
public:
    void set(std::string_view key, const std::optional<PropertyList>& value);

    // The change of that key; null when there is none. Valid until the next change.
    const PreferencesChange* find(std::string_view key) const;

    // In the order in which the keys were first set.
    const std::vector<PreferencesChange>& all() const { return _changes; }

    // Forgets these, but not what was set anew since they were taken.
    void forget(const std::vector<PreferencesChange>& taken);

private:
    std::vector<PreferencesChange> _changes;
    std::uint64_t _count = 0;
};

// The entries with the changes made: each in its place, new ones at the end.
PropertyList::Dictionary changed(const PropertyList::Dictionary& entries,
                                 const std::vector<PreferencesChange>& changes);

}  // namespace vlm::platform
