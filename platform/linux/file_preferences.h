// Preferences in property-list files, one file for each domain in each of three folders; which, and
// whom they are trusted to, is told in preferences_folders.h.
//
// What is set stays in memory until it is synchronised. No answer comes from memory alone
// otherwise: what others have put on the disk is seen by the next call.
//
// Domains are the names of programs: few, and each one asked for is kept for good. A child that was
// forked while another thread was in here must not come in again before it starts its program.

#pragma once

#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "platform/linux/cached_record.h"
#include "platform/linux/pending_changes.h"
#include "platform/linux/preferences_folders.h"
#include "platform/preferences.h"

namespace vlm::platform {

class FilePreferences final : public Preferences {
public:
    explicit FilePreferences(PreferencesFolders folders) : _folders(std::move(folders)) {}

    std::optional<PropertyList> value(std::string_view key, std::string_view domain,
                                      PreferencesUser user) override;
    bool isForced(std::string_view key, std::string_view domain) override;
    std::optional<PropertyList> applicationValue(std::string_view key,
                                                 std::string_view domain) override;
    void setValue(std::string_view key, const std::optional<PropertyList>& value,
                  std::string_view domain, PreferencesUser user) override;
    bool synchronise(std::string_view domain, PreferencesUser user) override;

private:
    struct Own {
        std::optional<CachedRecord> record;  // none for a user without a home
        PendingChanges pending;

        std::optional<PropertyList> value(std::string_view key);
    };

    struct Domain {
        CachedRecord managed;
        Own anyUser;
        Own currentUser;

        Own& of(PreferencesUser user) {
            return user == PreferencesUser::Any ? anyUser : currentUser;
        }
    };

    // Null for what is no domain. The mutex is held.
    Domain* find(std::string_view name);

    const PreferencesFolders _folders;

    // One thread at a time takes changes and writes them. Taken before the other one.
    std::mutex _writing;

    // Held for a look at the disk, but not while it is written. Protects what follows.
    std::mutex _mutex;
    std::map<std::string, Domain, std::less<>> _domains;
};

}  // namespace vlm::platform
