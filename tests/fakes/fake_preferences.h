#pragma once

#include <map>
#include <optional>
#include <set>
#include <string>
#include <tuple>

#include "platform/preferences.h"

namespace vlm::fakes {

class FakePreferences final : public platform::Preferences {
public:
    using User = platform::PreferencesUser;

    // What a test does to the world.
    void force(const std::string& key, const std::string& domain, platform::PropertyList value) {
        _forced.insert_or_assign({key, domain}, std::move(value));
    }
    void put(const std::string& key, const std::string& domain, User user,
             platform::PropertyList value) {
        _values.insert_or_assign({user, key, domain}, std::move(value));
    }
    void refuseWrites() { _writable = false; }

    std::optional<platform::PropertyList> value(std::string_view key, std::string_view domain,
                                                User user) override {
        const auto found = _values.find({user, std::string(key), std::string(domain)});
        if (found == _values.end()) return std::nullopt;
        return found->second;
    }

    bool isForced(std::string_view key, std::string_view domain) override {
        return _forced.contains({std::string(key), std::string(domain)});
    }

    std::optional<platform::PropertyList> applicationValue(std::string_view key,
                                                           std::string_view domain) override {
        const auto forced = _forced.find({std::string(key), std::string(domain)});
        if (forced != _forced.end()) return forced->second;
        auto own = value(key, domain, User::Current);
        return own ? own : value(key, domain, User::Any);
    }

    void setValue(std::string_view key, const std::optional<platform::PropertyList>& value,
                  std::string_view domain, User user) override {
        if (!_writable) return;
        const std::tuple place{user, std::string(key), std::string(domain)};
        if (value) {
            _values.insert_or_assign(place, *value);
        } else {
            _values.erase(place);
        }
    }

    bool synchronise(std::string_view domain, User user) override {
        synchronised.emplace_back(domain, user);
        return _writable;
    }

    std::vector<std::pair<std::string, User>> synchronised;

private:
    bool _writable = true;
    std::map<std::pair<std::string, std::string>, platform::PropertyList> _forced;
    std::map<std::tuple<User, std::string, std::string>, platform::PropertyList> _values;
};

}  // namespace vlm::fakes
