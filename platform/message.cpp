#include "platform/message.h"

#include <algorithm>

namespace vlm::platform {

namespace {

// Overwrites all that the text or the bytes have memory for: a short text that was moved away
// leaves its characters behind, and one that was cut leaves them beyond its end. The pointer is
// volatile because a store to memory that is about to be freed would be optimised away.
template <typename Characters>
void wipeCharacters(Characters& characters) {
    characters.resize(characters.capacity());
    volatile auto* place = characters.data();
    for (std::size_t at = 0; at < characters.size(); ++at) place[at] = 0;
    characters.clear();
}

void wipeValue(Message::Value& value) {
    if (auto* text = std::get_if<std::string>(&value)) wipeCharacters(*text);
    if (auto* bytes = std::get_if<Bytes>(&value)) wipeCharacters(*bytes);
}

}  // namespace

Message& Message::operator=(Message&& other) noexcept {
    if (this == &other) return *this;
    wipe();
    _entries = std::move(other._entries);
    return *this;
}

Message& Message::operator=(const Message& other) { return *this = Message(other); }

Message::~Message() { wipe(); }

void Message::set(std::string_view key, Value value) {
    const auto entry = std::ranges::find(_entries, key, &Entry::first);
    if (entry != _entries.end()) {
        wipeValue(entry->second);
        entry->second = std::move(value);
    } else {
        std::string name(key);  // before the entries move, since it may be a view into one
        makeRoom();
        _entries.emplace_back(std::move(name), std::move(value));
    }
    wipeValue(value);
}

std::optional<std::uint64_t> Message::unsignedInteger(std::string_view key) const {
    const auto* number = std::get_if<std::uint64_t>(find(key));
    return number ? std::optional(*number) : std::nullopt;
}

std::optional<std::int64_t> Message::integer(std::string_view key) const {
    const auto* number = std::get_if<std::int64_t>(find(key));
    return number ? std::optional(*number) : std::nullopt;
}

const std::string* Message::text(std::string_view key) const {
    return std::get_if<std::string>(find(key));
}

const Bytes* Message::bytes(std::string_view key) const { return std::get_if<Bytes>(find(key)); }

std::optional<Endpoint> Message::endpoint(std::string_view key) const {
    const auto* endpoint = std::get_if<Endpoint>(find(key));
    return endpoint ? std::optional(*endpoint) : std::nullopt;
}

const Message::Value* Message::find(std::string_view key) const {
    const auto entry = std::ranges::find(_entries, key, &Entry::first);
    return entry == _entries.end() ? nullptr : &entry->second;
}

// A vector that grows by itself gives its old memory back with the short texts still in it.
void Message::makeRoom() {
    constexpr std::size_t kUsualEntries = 8;
    if (_entries.size() < _entries.capacity()) return;
    std::vector<Entry> larger;
    larger.reserve(std::max(kUsualEntries, _entries.size() * 2));
    std::ranges::move(_entries, std::back_inserter(larger));
    wipe();
    _entries = std::move(larger);
}

void Message::wipe() {
    for (auto& entry : _entries) wipeValue(entry.second);
}

}  // namespace vlm::platform
