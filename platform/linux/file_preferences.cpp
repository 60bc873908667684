#include "platform/linux/file_preferences.h"

#include <utility>
#include <vector>

#include "platform/linux/preferences_writer.h"
#include "platform/platform.h"

namespace vlm::platform {

namespace {

std::optional<PropertyList> copyOf(const PropertyList* value) {
    if (!value) return std::nullopt;
    return *value;
}

}  // namespace

std::optional<PropertyList> FilePreferences::Own::value(std::string_view key) {
    if (const auto* change = pending.find(key)) return change->value;
    if (!record) return std::nullopt;
    return copyOf(record->entries().find(key));
}

FilePreferences::Domain* FilePreferences::find(std::string_view name) {
    const auto known = _domains.find(name);
    if (known != _domains.end()) return &known->second;
    if (!isPreferencesDomain(name)) return nullptr;
    Domain domain{
        CachedRecord(_folders.managed, name), {CachedRecord(_folders.anyUser, name), {}}, {}};
    if (_folders.currentUser) domain.currentUser.record.emplace(*_folders.currentUser, name);
    return &_domains.emplace(name, std::move(domain)).first->second;
}

std::optional<PropertyList> FilePreferences::value(std::string_view key, std::string_view domain,
                                                   PreferencesUser user) {
    const std::lock_guard lock(_mutex);
    auto* found = find(domain);
    if (!found) return std::nullopt;
    return found->of(user).value(key);
}

bool FilePreferences::isForced(std::string_view key, std::string_view domain) {
    const std::lock_guard lock(_mutex);
    auto* found = find(domain);
    return found && found->managed.entries().contains(key);
}

std::optional<PropertyList> FilePreferences::applicationValue(std::string_view key,
                                                              std::string_view domain) {
    const std::lock_guard lock(_mutex);
    auto* found = find(domain);
    if (!found) return std::nullopt;
    if (const auto* forced = found->managed.entries().find(key)) return *forced;
    auto own = found->currentUser.value(key);
    return own ? own : found->anyUser.value(key);
}

void FilePreferences::setValue(std::string_view key, const std::optional<PropertyList>& value,
                               std::string_view domain, PreferencesUser user) {
    const std::lock_guard lock(_mutex);
    if (auto* found = find(domain)) found->of(user).pending.set(key, value);
}

bool FilePreferences::synchronise(std::string_view domain, PreferencesUser user) {
    // Or else a thread that took the changes early might write them late, over what another thread
    // has set and written since.
    const std::lock_guard writing(_writing);
    std::vector<PreferencesChange> changes;
    {
        const std::lock_guard lock(_mutex);
        auto* found = find(domain);
        if (!found) return false;
        changes = found->of(user).pending.all();
    }
    if (changes.empty()) return true;
    const auto* folder = user == PreferencesUser::Any ? &_folders.anyUser
                         : _folders.currentUser       ? &*_folders.currentUser
                                                      : nullptr;
    const bool isWritten = folder && writeChanges(*folder, domain, changes);

    // Until here the changes were pending, so that no reader has missed them in between.
    const std::lock_guard lock(_mutex);
    find(domain)->of(user).pending.forget(changes);
    return isWritten;
}

Preferences& Platform::preferences() {
    static auto& service = *new FilePreferences(PreferencesFolders::ofThisMachine());
    return service;
}

}  // namespace vlm::platform
