#pragma once

#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "platform/preferences.h"

namespace vlm::fakes {

class FakePreferences final : public platform::Preferences {
public:
    using User = platform::PreferencesUser;
    using Value = std::optional<platform::PropertyList>;

    // What a test does to the world.
    void force(const std::string& key, const std::string& domain, platform::PropertyList value) {
        _forced.insert_or_assign({key, domain}, std::move(value));
    }
    void put(const std::string& key, const std::string& domain, User user,
             platform::PropertyList value) {
        _written.insert_or_assign({user, domain, key}, std::move(value));
    }
    void refuseWrites() { _writable = false; }

    // What others see, who know nothing of what was set and not synchronised.
    Value written(const std::string& key, const std::string& domain, User user) const {
        return valueIn(_written, {user, domain, key});
    }

    Value value(std::string_view key, std::string_view domain, User user) override {
        const Place place{user, std::string(domain), std::string(key)};
        const auto pending = _pending.find(place);
        return pending == _pending.end() ? valueIn(_written, place) : pending->second;
    }

    bool isForced(std::string_view key, std::string_view domain) override {
        return _forced.contains({std::string(key), std::string(domain)});
    }

    Value applicationValue(std::string_view key, std::string_view domain) override {
        if (auto forced = valueIn(_forced, {std::string(key), std::string(domain)})) return forced;
        auto own = value(key, domain, User::Current);
        return own ? own : value(key, domain, User::Any);
    }

    void setValue(std::string_view key, const Value& value, std::string_view domain,
                  User user) override {
        if (!platform::isPreferencesDomain(domain)) return;
        _pending.insert_or_assign({user, std::string(domain), std::string(key)}, value);
    }

    bool synchronise(std::string_view domain, User user) override {
        synchronised.emplace_back(domain, user);
        if (!platform::isPreferencesDomain(domain)) return false;
        bool isWritten = true;
        for (auto each = _pending.begin(); each != _pending.end();) {
            const auto& [place, value] = *each;
            if (std::get<0>(place) != user || std::get<1>(place) != domain) {
                ++each;
                continue;
            }
            if (_writable) write(place, value);
            isWritten = _writable;
            each = _pending.erase(each);
        }
        return isWritten;
    }

    std::vector<std::pair<std::string, User>> synchronised;

private:
    using Place = std::tuple<User, std::string, std::string>;  // domain, key

    template <typename Map>
    static Value valueIn(const Map& map, const typename Map::key_type& place) {
        const auto found = map.find(place);
        return found == map.end() ? std::nullopt : Value(found->second);
    }

    void write(const Place& place, const Value& value) {
        if (value) {
            _written.insert_or_assign(place, *value);
        } else {
            _written.erase(place);
        }
    }

    bool _writable = true;
    std::map<std::pair<std::string, std::string>, platform::PropertyList> _forced;
    std::map<Place, platform::PropertyList> _written;
    std::map<Place, Value> _pending;
};

}  // namespace vlm::fakes
