// Preferences: values by key and domain that outlive the process, in records of their own for what
// management forces, for every user of this machine, and for the current user on this machine.
//
// Shapes:    a value is a property list; keys are UTF-8; a domain is a reverse-DNS name.
// Ownership: values are the caller's own.
// Threads:   any.
// Blocking:  on the file system; synchronise() also on other writers of the same record, for a
//            bounded time.
// Errors:    a record that is missing, malformed or not to be trusted reads as empty; the log tells
//            the last two. What is no domain has no record: it reads as empty, nothing can be set.
//            Writing fails only as a false answer of synchronise().
// Behind it: platform/linux/file_preferences.h
// In tests:  tests/fakes/fake_preferences.h, tests/contracts/preferences_contract.h,
//            tests/integration/preferences/

#pragma once

#include <optional>
#include <string_view>

#include "platform/property_list.h"

namespace vlm::platform {

// Whose record. The host is always this machine.
enum class PreferencesUser { Any, Current };

// Whether the text can be a domain: ASCII letters, digits, hyphens, underscores, and single dots
// inside; at most 200 of them.
bool isPreferencesDomain(std::string_view domain);

class Preferences {
public:
    virtual ~Preferences() = default;

    // The value in that one record; none when it has none.
    virtual std::optional<PropertyList> value(std::string_view key, std::string_view domain,
                                              PreferencesUser user) = 0;

    // Whether management decides the key, so that nobody's own value counts.
    virtual bool isForced(std::string_view key, std::string_view domain) = 0;

    // The value that a program should go by: what is forced, else the current user's, else the one
    // for any user.
    virtual std::optional<PropertyList> applicationValue(std::string_view key,
                                                         std::string_view domain) = 0;

    // Sets the key in that record, or removes it when there is no value. This process sees it at
    // once, others after synchronise().
    virtual void setValue(std::string_view key, const std::optional<PropertyList>& value,
                          std::string_view domain, PreferencesUser user) = 0;

    // Puts what was set in that record on the disk, together with what others have written there
    // meanwhile. False when that failed; what was set is then dropped.
    virtual bool synchronise(std::string_view domain, PreferencesUser user) = 0;
};

}  // namespace vlm::platform
