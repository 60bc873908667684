#include "platform/binary_property_list_numbering.h"

#include <algorithm>
#include <bit>
#include <limits>

#include "platform/property_list_index.h"
#include "platform/property_list_reading.h"
#include "platform/utf.h"

namespace vlm::platform::binary_format {

namespace {

// Of text in UTF-8, which is Kind::Ascii until it is known to be anything else.
WrittenObject counted(Kind kind, std::string_view bytes) {
    return {.kind = kind, .count = bytes.size(), .number = bytes.size(), .data = bytes.data()};
}

std::uint32_t hashOfScalar(const WrittenObject& object) {
    return object.data ? hashOf(object.bytes())
                       : hashOf(object.number + (static_cast<std::uint64_t>(object.kind) << 56U));
}

bool isSameScalar(const WrittenObject& one, const WrittenObject& other) {
    const auto family = [](Kind kind) { return kind == Kind::Utf16 ? Kind::Ascii : kind; };
    return family(one.kind) == family(other.kind) && one.number == other.number &&
           one.isAboveSigned == other.isAboveSigned && one.bytes() == other.bytes();
}

// Holds a value against the limits before anything is made of it.
class Measure {
public:
    explicit Measure(const PropertyListLimits& limits) : _limits(limits), _budget(limits) {}

    bool allows(const PropertyList& value, std::size_t depth = 0) {
        ++_uses;
        if (!_budget.takeObjects(1)) return false;
        if (const auto* text = value.text()) return _budget.takeBytes(text->size());
        if (const auto* bytes = value.bytes()) return _budget.takeBytes(bytes->size());
        if (const auto* array = value.array())
            return depth < _limits.depth &&
                   std::ranges::all_of(
                       *array, [&](const PropertyList& each) { return allows(each, depth + 1); });
        if (const auto* dictionary = value.dictionary())
            return depth < _limits.depth &&
                   std::ranges::all_of(*dictionary, [&](const auto& entry) {
                       ++_uses;
                       return _budget.takeObjects(1) && _budget.takeBytes(entry.first.size()) &&
                              allows(entry.second, depth + 1);
                   });
        return true;
    }

    // How many values and keys there are.
    std::size_t uses() const { return _uses; }

private:
    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
    std::size_t _uses = 0;
};

// Functions that add something answer its number, or none for text that is not UTF-8.
class Numbering {
public:
    // Half of the uses are taken to be of something new.
    explicit Numbering(std::size_t uses) : _known(uses / 2) {
        _written.objects.reserve(uses);
        _written.references.reserve(uses);
    }

    std::optional<WrittenObjects> of(const PropertyList& value) {
        if (!add(value)) return std::nullopt;
        return std::move(_written);
    }

private:
    using Number = std::optional<std::uint32_t>;

    Number add(const PropertyList& value) {
        if (const auto* text = value.text()) return addText(*text);
        if (const auto* dictionary = value.dictionary()) return addDictionary(*dictionary);
        if (const auto* array = value.array()) return addArray(*array);
        return addScalar(scalarOf(value));
    }

    static WrittenObject scalarOf(const PropertyList& value) {
        if (const auto* bytes = value.bytes())
            return counted(Kind::Data,
                           {reinterpret_cast<const char*>(bytes->data()), bytes->size()});
        if (const auto boolean = value.boolean())
            return {.kind = Kind::Constant, .number = *boolean ? kTrue : kFalse};
        if (const auto integer = value.integer())
            return {.kind = Kind::Integer, .number = static_cast<std::uint64_t>(*integer)};
        if (const auto above = value.unsignedInteger())
            return {.kind = Kind::Integer, .isAboveSigned = true, .number = *above};
        if (const auto real = value.real())
            return {.kind = Kind::Real, .number = std::bit_cast<std::uint64_t>(*real)};
        const double date = value.date().value_or(PropertyList::Date{}).secondsSince2001;
        return {.kind = Kind::Date, .number = std::bit_cast<std::uint64_t>(date)};
    }

    // Numbers fit because references to all objects are held, four bytes each.
    std::uint32_t nextNumber() const { return static_cast<std::uint32_t>(_written.objects.size()); }

    // Answers where its references begin.
    std::size_t addCollection(Kind kind, std::size_t count, std::size_t references) {
        const std::size_t first = _written.references.size();
        _written.objects.push_back({.kind = kind, .count = count, .number = first});
        _written.references.resize(first + references);
        return first;
    }

    Number addArray(const PropertyList::Array& array) {
        const std::uint32_t number = nextNumber();
        std::size_t reference = addCollection(Kind::Array, array.size(), array.size());
        for (const auto& each : array)
            if (!refer(reference++, add(each))) return std::nullopt;
        return number;
    }

    // All keys come before all values.
    Number addDictionary(const PropertyList::Dictionary& dictionary) {
        const std::uint32_t number = nextNumber();
        std::size_t reference =
            addCollection(Kind::Dictionary, dictionary.size(), 2 * dictionary.size());
        for (const auto& entry : dictionary)
            if (!refer(reference++, addText(entry.first))) return std::nullopt;
        for (const auto& entry : dictionary)
            if (!refer(reference++, add(entry.second))) return std::nullopt;
        return number;
    }

    bool refer(std::size_t reference, Number to) {
        if (to) _written.references[reference] = *to;
        return to.has_value();
    }

    Number addText(std::string_view text) {
        const std::uint32_t next = nextNumber();
        const std::uint32_t number = addScalar(counted(Kind::Ascii, text));
        if (number != next || isAscii(text)) return number;

        const auto units = utf8ToUtf16(text);
        if (!units) return std::nullopt;
        _written.objects[next].kind = Kind::Utf16;
        _written.objects[next].count = units->size();
        return number;
    }

    // A scalar that cannot be found for all the others in its way is written once more.
    std::uint32_t addScalar(const WrittenObject& scalar) {
        const std::uint32_t next = nextNumber();
        const auto isSame = [&](std::uint32_t number) {
            return isSameScalar(_written.objects[number], scalar);
        };
        const std::uint32_t number =
            _known.findOrAdd(hashOfScalar(scalar), next, isSame).value_or(next);
        if (number == next) _written.objects.push_back(scalar);
        return number;
    }

    WrittenObjects _written;
    PropertyListIndex _known;
};

}  // namespace

std::optional<WrittenObjects> numberObjects(const PropertyList& value,
                                            const PropertyListLimits& limits) {
    Measure measure(limits);
    if (!measure.allows(value)) return std::nullopt;
    return Numbering(measure.uses()).of(value);
}

}  // namespace vlm::platform::binary_format
