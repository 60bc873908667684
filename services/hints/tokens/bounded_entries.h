// The entries of a message that is not believed, within bounds.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "platform/harmless_text.h"
#include "platform/property_list.h"
#include "services/hints/tokens/card_text.h"

namespace vlm::service {

// Reads entries of one dictionary; after an entry that is missing, of a wrong type or out of
// bounds it has failed, and says so at the end, so that each entry needs no check of its own.
class BoundedEntries {
public:
    explicit BoundedEntries(const platform::PropertyList* value)
        : _entries(value == nullptr ? nullptr : value->dictionary()),
          _failed(_entries == nullptr) {}

    bool failed() const { return _failed; }
    bool has(std::string_view key) const { return _entries != nullptr && _entries->contains(key); }

    std::string text(std::string_view key, std::size_t most) {
        const platform::PropertyList* value = find(key);
        const std::string* text = value == nullptr ? nullptr : value->text();
        if (text == nullptr || text->size() > most) return fail<std::string>();
        return *text;
    }
    std::string cardText(std::string_view key, std::size_t characters) {
        return vlm::service::cardText(text(key, characters * 4 + platform::kCutMark.size()),
                                      characters);
    }
    Bytes bytes(std::string_view key, std::size_t least, std::size_t most) {
        const platform::PropertyList* value = find(key);
        const Bytes* bytes = value == nullptr ? nullptr : value->bytes();
        if (bytes == nullptr || bytes->size() < least || bytes->size() > most) return fail<Bytes>();
        return *bytes;
    }
    bool boolean(std::string_view key) {
        const platform::PropertyList* value = find(key);
        const auto boolean = value == nullptr ? std::nullopt : value->boolean();
        return boolean ? *boolean : fail<bool>();
    }
    std::int64_t integer(std::string_view key) {
        const platform::PropertyList* value = find(key);
        const auto integer = value == nullptr ? std::nullopt : value->integer();
        return integer ? *integer : fail<std::int64_t>();
    }
    // One of an enumeration's values, which have no gap between them.
    template <typename Enumeration>
    Enumeration oneOf(std::string_view key, Enumeration first, Enumeration last) {
        const std::int64_t number = integer(key);
        const bool isOne =
            number >= static_cast<std::int64_t>(first) && number <= static_cast<std::int64_t>(last);
        if (isOne) return static_cast<Enumeration>(number);
        _failed = true;
        return first;
    }
    const platform::PropertyList::Array& array(std::string_view key, std::size_t most) {
        static const platform::PropertyList::Array kNone;
        const platform::PropertyList* value = find(key);
        const auto* array = value == nullptr ? nullptr : value->array();
        if (array != nullptr && array->size() <= most) return *array;
        _failed = true;
        return kNone;
    }

private:
    const platform::PropertyList* find(std::string_view key) const {
        return _entries == nullptr ? nullptr : _entries->find(key);
    }
    template <typename Value>
    Value fail() {
        _failed = true;
        return Value{};
    }

    const platform::PropertyList::Dictionary* _entries;
    bool _failed;
};

}  // namespace vlm::service
