// What the readers of all property-list formats have in common.
//
// Errors: a reader answers a value, or a problem: a sentence for a person and where it is. The
//         problem of a binary list has no place that a person could go to.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/property_list.h"

namespace vlm::platform {

struct PropertyListReading {
    std::optional<PropertyList> value;
    std::string problem;
    std::size_t offset = 0;  // of the problem, in bytes of the text
};

bool isBinaryPropertyList(std::span<const std::uint8_t> data);

PropertyListReading readBinaryPropertyList(std::span<const std::uint8_t> data,
                                           const PropertyListLimits& limits);

PropertyListReading readXmlPropertyList(std::string_view text, const PropertyListLimits& limits);
PropertyListReading readTextPropertyList(std::string_view text, const PropertyListLimits& limits);

// The first problem that a reader met. Its functions answer none and let it through to the top;
// once there is one, the list has no value.
class FirstProblem {
public:
    std::nullopt_t at(std::size_t offset, std::string sentence) {
        if (_sentence.empty()) {
            _sentence = std::move(sentence);
            _offset = offset;
        }
        return std::nullopt;
    }

    PropertyListReading with(std::optional<PropertyList> value) && {
        if (value && _sentence.empty()) return {std::move(value), {}, 0};
        return {std::nullopt, std::move(_sentence), _offset};
    }

private:
    std::string _sentence;
    std::size_t _offset = 0;
};

// What the rest of a list may cost. Readers and writers charge alike, so that whatever is written
// within some limits can be read within them.
class PropertyListBudget {
public:
    explicit PropertyListBudget(const PropertyListLimits& limits)
        : _objects(limits.objects), _bytes(limits.bytes) {}

    // False when that many are no longer allowed.
    bool takeObjects(std::uint64_t count) { return take(count, _objects); }
    bool takeBytes(std::uint64_t count) { return take(count, _bytes); }

private:
    static bool take(std::uint64_t count, std::size_t& left) {
        if (count > left) return false;
        left -= static_cast<std::size_t>(count);
        return true;
    }

    std::size_t _objects;
    std::size_t _bytes;
};

inline constexpr std::string_view kTooDeep =
    "Arrays and dictionaries lie too deep inside each other.";
inline constexpr std::string_view kTooManyObjects = "There are more values than are read.";
inline constexpr std::string_view kTooManyBytes = "There is more text and data than is read.";

using PropertyListEntries = std::vector<PropertyList::Dictionary::Entry>;

// A key that comes more than once has its last value, in the place of the first.
PropertyList dictionaryOf(PropertyListEntries entries);

// Something out of the input in quotes, fit for a sentence: short and harmless.
std::string quotedForPerson(std::string_view input);

}  // namespace vlm::platform
