#include "bind/token_info.h"

#include <algorithm>
#include <optional>
#include <set>
#include <string_view>

namespace vlm {

using platform::Bytes;
using platform::PropertyList;

namespace {

using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

const Array& arrayAt(const Dictionary& record, std::string_view key) {
    static const Array none;
    const auto* value = record.find(key);
    const auto* array = value ? value->array() : nullptr;
    return array ? *array : none;
}

const Dictionary& dictionaryAt(const Dictionary& record, std::string_view key) {
    static const Dictionary none;
    const auto* value = record.find(key);
    const auto* dictionary = value ? value->dictionary() : nullptr;
    return dictionary ? *dictionary : none;
}

// A token identifier is text and nothing else.
std::optional<std::string> identifier(const PropertyList& value) {
    if (const auto* text = value.text()) return *text;
    return std::nullopt;
}

// What is only shown may be of any type.
std::optional<std::string> shownText(const PropertyList& value) {
    if (const auto* text = value.text()) return *text;
    return value.describe();
}

template <typename Convert>
TokenInfo::TextByHash pairUp(const Array& hashes, const Array& values, Convert convert) {
    TokenInfo::TextByHash map;
    const std::size_t size = std::min(hashes.size(), values.size());
    for (std::size_t i = 0; i < size; ++i) {
        const Bytes* hash = hashes[i].bytes();
        const auto value = convert(values[i]);
        if (hash && value) map[*hash] = *value;
    }
    return map;
}

std::vector<std::string> sortedIdentifiers(const Array& values) {
    std::set<std::string> sorted;
    for (const auto& value : values)
        if (const auto* text = value.text()) sorted.insert(*text);
    return {sorted.begin(), sorted.end()};
}

}  // namespace

TokenInfo::TokenInfo(const PropertyList& record) {
    const Dictionary* info = record.dictionary();
    if (!info) return;

    tokens = sortedIdentifiers(arrayAt(*info, "tni"));
    tokenByHash = pairUp(arrayAt(*info, "tnh"), arrayAt(*info, "tni"), identifier);
    for (const auto& [hash, token] : tokenByHash) hashesByToken[token].push_back(hash);

    offered = pairUp(arrayAt(*info, "unk"), arrayAt(*info, "unv"), shownText);
    bound = pairUp(arrayAt(*info, "hsk"), arrayAt(*info, "hsv"), shownText);
    names = pairUp(arrayAt(*info, "fnh"), arrayAt(*info, "fni"), shownText);
    wrapKeys = pairUp(arrayAt(*info, "uth"), arrayAt(*info, "uti"), identifier);
    for (const auto& [token, name] : dictionaryAt(*info, "ftn"))
        cardNames[token] = *shownText(name);

    for (const auto& hash : arrayAt(*info, "hsk"))
        if (const Bytes* bytes = hash.bytes()) boundHashes.push_back(*bytes);
    for (const auto& [account, hash] : dictionaryAt(*info, "hsh"))
        if (const Bytes* bytes = hash.bytes()) authentication.emplace_back(account, *bytes);
}

}  // namespace vlm
