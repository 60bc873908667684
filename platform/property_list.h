// PropertyList: one typed value (boolean, integer, real, text, bytes, date, array, dictionary),
// and its serialisations: binary and XML, read and written, and the old text format, read.
//
// Shapes:   a dictionary keeps its entries in the order they were set; keys are UTF-8 text.
//           Integers are whole 64-bit numbers, signed or unsigned; a boolean is never a number.
// Units:    a date is seconds since 2001-01-01 00:00:00 UTC.
// Threads:  values; distinct values are independent.
// Errors:   reading answers none for anything that is not a well-formed list within the limits:
//           no offset, count or length of the input is trusted. Writing answers none for a value
//           that the format cannot hold (text that is not UTF-8), that exceeds the limits, or whose
//           binary list could take more than 4 GiB.
// Choice:   a key that comes more than once has its last value, in every format.
// Source:   the binary property-list format 1.0 ("bplist00": object table, offset table, trailer);
//           XML 1.0 with the elements plist, dict, key, array, string, integer, real, true, false,
//           date and data. A document type is read over, and no entity of its own is expanded.
// In tests: tests/unit/platform/*property_list*_test.cpp, fuzz/

#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "platform/export.h"
#include "platform/types.h"

namespace vlm::platform {

class VLM_EXPORT PropertyList {
public:
    struct Date {
        double secondsSince2001 = 0;
        bool operator==(const Date&) const = default;
    };

    using Array = std::vector<PropertyList>;

    // Keys with their values, in the order in which the keys were first set. The order is part
    // of the value: equal dictionaries have it in common.
    class VLM_EXPORT Dictionary {
    public:
        using Entry = std::pair<std::string, PropertyList>;

        Dictionary() = default;
        Dictionary(std::initializer_list<Entry> entries);

        // Of entries whose keys are known to differ.
        static Dictionary ofDistinct(std::vector<Entry> entries);

        // The value under the key; null when there is none. Valid until the next change.
        const PropertyList* find(std::string_view key) const;

        // Sets the key's value, in its place when the key is there already.
        void set(std::string key, PropertyList value);

        // Adds an entry whose key is known to be new, without looking for it.
        void append(std::string key, PropertyList value);

        bool contains(std::string_view key) const { return find(key) != nullptr; }
        std::size_t size() const;
        bool empty() const;
        std::vector<Entry>::const_iterator begin() const;
        std::vector<Entry>::const_iterator end() const;

        bool operator==(const Dictionary& other) const;

    private:
        std::vector<Entry> _entries;
    };

    // An integer above the signed range is held as unsigned, every other one as signed.
    // The boolean is a template so that nothing else turns into one: a pointer would, silently.
    template <std::same_as<bool> Boolean>
    PropertyList(Boolean value) : _value(value) {}                          // NOLINT: values
    PropertyList(int value) : _value(std::int64_t{value}) {}                // NOLINT
    PropertyList(std::int64_t value) : _value(value) {}                     // NOLINT
    PropertyList(std::uint64_t value);                                      // NOLINT
    PropertyList(double value) : _value(value) {}                           // NOLINT
    PropertyList(const char* text) : _value(std::string(text)) {}           // NOLINT
    PropertyList(std::string_view text) : _value(std::string(text)) {}      // NOLINT
    PropertyList(std::string text) : _value(std::move(text)) {}             // NOLINT
    PropertyList(Bytes bytes) : _value(std::move(bytes)) {}                 // NOLINT
    PropertyList(Date date) : _value(date) {}                               // NOLINT
    PropertyList(Array array) : _value(std::move(array)) {}                 // NOLINT
    PropertyList(Dictionary dictionary) : _value(std::move(dictionary)) {}  // NOLINT

    // The value as one kind; null (none for the scalars) when it is of another kind.
    std::optional<bool> boolean() const;
    std::optional<std::int64_t> integer() const;           // none also above the signed range
    std::optional<std::uint64_t> unsignedInteger() const;  // none also below zero
    std::optional<double> real() const;
    std::optional<Date> date() const;
    const std::string* text() const;
    const Bytes* bytes() const;
    const Array* array() const;
    const Dictionary* dictionary() const;

    // Calls the visitor with the value as the type that it is held as, and answers what that does.
    template <typename Visitor>
    decltype(auto) visit(Visitor&& visitor) const {
        return std::visit(std::forward<Visitor>(visitor), _value);
    }

    // The value in a form for people and logs, on one line.
    std::string describe() const;

    bool operator==(const PropertyList& other) const;

private:
    std::variant<bool, std::int64_t, std::uint64_t, double, std::string, Bytes, Date, Array,
                 Dictionary>
        _value;
};

// What a list may cost. A binary list may cost no more than eight values a byte either, beyond the
// first few thousand, however often it refers to the same ones.
struct PropertyListLimits {
    std::size_t depth = 512;                     // arrays and dictionaries inside each other
    std::size_t objects = 1U << 20U;             // values made, each use of a shared one counted
    std::size_t bytes = std::size_t{64} << 20U;  // of input, and of what the values made hold
};

// Reads a serialised property list, of whatever format it is in.
VLM_EXPORT std::optional<PropertyList> readPropertyList(std::span<const std::uint8_t> data,
                                                        const PropertyListLimits& limits = {});

enum class PropertyListFormat { Binary, Xml, Text };

// Reads like readPropertyList(), and tells a person what is wrong where.
struct PropertyListExamination {
    PropertyListFormat format = PropertyListFormat::Text;  // what the data looks like
    std::optional<PropertyList> value;
    std::string problem;     // a sentence; empty when there is a value
    std::size_t line = 0;    // of the problem, counted from 1; 0 in a binary list
    std::size_t column = 0;  // in characters, counted from 1; 0 likewise
};
PropertyListExamination examinePropertyList(std::span<const std::uint8_t> data,
                                            const PropertyListLimits& limits = {});

// Writes the binary format 1.0; the same value always gives the same bytes.
VLM_EXPORT std::optional<Bytes> writeBinaryPropertyList(const PropertyList& value,
                                                        const PropertyListLimits& limits = {});

// Writes XML, with line breaks and indents for people. None also for a value that XML has no form
// for: text with control characters, a date that is no whole second of the years 1 to 9999.
std::optional<std::string> writeXmlPropertyList(const PropertyList& value,
                                                const PropertyListLimits& limits = {});

}  // namespace vlm::platform
