#include "platform/property_list.h"

#include <algorithm>
#include <limits>

namespace vlm::platform {

PropertyList::Dictionary::Dictionary(std::initializer_list<Entry> entries) {
    for (const auto& [key, value] : entries) set(key, value);
}

PropertyList::Dictionary PropertyList::Dictionary::ofDistinct(std::vector<Entry> entries) {
    Dictionary dictionary;
    dictionary._entries = std::move(entries);
    return dictionary;
}

const PropertyList* PropertyList::Dictionary::find(std::string_view key) const {
    const auto entry = std::ranges::find(_entries, key, &Entry::first);
    return entry == _entries.end() ? nullptr : &entry->second;
}

void PropertyList::Dictionary::set(std::string key, PropertyList value) {
    const auto entry = std::ranges::find(_entries, key, &Entry::first);
    if (entry == _entries.end()) return append(std::move(key), std::move(value));
    entry->second = std::move(value);
}

void PropertyList::Dictionary::append(std::string key, PropertyList value) {
    _entries.emplace_back(std::move(key), std::move(value));
}

std::size_t PropertyList::Dictionary::size() const { return _entries.size(); }
bool PropertyList::Dictionary::empty() const { return _entries.empty(); }

std::vector<PropertyList::Dictionary::Entry>::const_iterator PropertyList::Dictionary::begin()
    const {
    return _entries.begin();
}

std::vector<PropertyList::Dictionary::Entry>::const_iterator PropertyList::Dictionary::end() const {
    return _entries.end();
}

bool PropertyList::Dictionary::operator==(const Dictionary& other) const {
    return _entries == other._entries;
}

bool PropertyList::operator==(const PropertyList& other) const { return _value == other._value; }

PropertyList::PropertyList(std::uint64_t value) : _value(value) {
    if (value <= std::uint64_t{std::numeric_limits<std::int64_t>::max()})
        _value = static_cast<std::int64_t>(value);
}

std::optional<bool> PropertyList::boolean() const {
    const auto* value = std::get_if<bool>(&_value);
    return value ? std::optional(*value) : std::nullopt;
}

std::optional<std::int64_t> PropertyList::integer() const {
    const auto* value = std::get_if<std::int64_t>(&_value);
    return value ? std::optional(*value) : std::nullopt;
}

std::optional<std::uint64_t> PropertyList::unsignedInteger() const {
    if (const auto* value = std::get_if<std::uint64_t>(&_value)) return *value;
    const auto value = integer();
    if (!value || *value < 0) return std::nullopt;
    return static_cast<std::uint64_t>(*value);
}

std::optional<double> PropertyList::real() const {
    const auto* value = std::get_if<double>(&_value);
    return value ? std::optional(*value) : std::nullopt;
}

std::optional<PropertyList::Date> PropertyList::date() const {
    const auto* value = std::get_if<Date>(&_value);
    return value ? std::optional(*value) : std::nullopt;
}

const std::string* PropertyList::text() const { return std::get_if<std::string>(&_value); }
const Bytes* PropertyList::bytes() const { return std::get_if<Bytes>(&_value); }
const PropertyList::Array* PropertyList::array() const { return std::get_if<Array>(&_value); }

const PropertyList::Dictionary* PropertyList::dictionary() const {
    return std::get_if<Dictionary>(&_value);
}

}  // namespace vlm::platform
