#include <algorithm>

#include "platform/binary_property_list.h"
#include "platform/binary_property_list_objects.h"
#include "platform/property_list_reading.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

using namespace binary_format;

// What the trailer says, checked against the input; offsets and references are at most 8 bytes.
struct Layout {
    std::size_t offsetWidth = 0;
    std::size_t referenceWidth = 0;
    std::uint64_t objectCount = 0;
    std::uint64_t topObject = 0;
    Input objects;  // up to the offset table, magic included, since offsets count from there
    Input offsets;
};

std::optional<Layout> readLayout(Input data, FirstProblem& problem) {
    const auto fail = [&](const char* sentence) { return problem.at(0, sentence); };
    if (data.size() < kMagic.size() + kTrailerSize)
        return fail("It is too short for a binary property list.");
    const Input trailer = data.last(kTrailerSize).subspan(kTrailerUnused);
    const Input beforeTrailer = data.first(data.size() - kTrailerSize);

    Layout layout;
    layout.offsetWidth = trailer[0];
    layout.referenceWidth = trailer[1];
    layout.objectCount = numberIn(trailer.subspan(2, 8));
    layout.topObject = numberIn(trailer.subspan(10, 8));
    const std::uint64_t table = numberIn(trailer.subspan(18, 8));

    const auto isWidth = [](std::size_t width) { return width >= 1 && width <= 8; };
    if (!isWidth(layout.offsetWidth)) return fail("The trailer gives no width of offsets.");
    if (!isWidth(layout.referenceWidth)) return fail("The trailer gives no width of references.");
    if (table > beforeTrailer.size()) return fail("The trailer points beyond the data.");
    layout.objects = beforeTrailer.first(static_cast<std::size_t>(table));
    layout.offsets = beforeTrailer.subspan(static_cast<std::size_t>(table));
    if (layout.objectCount > layout.offsets.size() / layout.offsetWidth)
        return fail("The trailer counts more objects than there are offsets.");
    return layout;
}

const char* nameOf(Kind kind) {
    switch (kind) {
        case Kind::Constant:
            return "a constant";
        case Kind::Integer:
            return "an integer";
        case Kind::Real:
            return "a real number";
        case Kind::Date:
            return "a date";
        case Kind::Data:
            return "data";
        case Kind::Ascii:
            return "ASCII text";
        case Kind::Utf16:
            return "UTF-16 text";
        case Kind::Array:
            return "an array";
        case Kind::Dictionary:
            return "a dictionary";
    }
    return "of an unknown kind";
}

// Makes values out of objects, from the top down. An object that is used twice is made twice, and
// its contents with it; the budget bounds what that can add up to, and the depth ends every cycle.
class Reader {
public:
    Reader(const Layout& layout, const PropertyListLimits& limits, FirstProblem& problem)
        : _layout(layout), _limits(limits), _budget(limits), _problem(problem) {}

    std::optional<PropertyList> read() {
        if (!_budget.takeObjects(1)) return fail(kTooManyObjects);
        return value(_layout.topObject, 0);
    }

private:
    std::nullopt_t fail(std::string_view sentence) { return _problem.at(0, std::string(sentence)); }
    std::nullopt_t failOf(std::uint64_t number, std::string_view complaint) {
        return fail(text("Object {} {}", number, complaint));
    }

    std::optional<Object> object(std::uint64_t number) {
        if (number >= _layout.objectCount)
            return failOf(number, "is referred to, and there are not so many.");
        const auto entry = static_cast<std::size_t>(number) * _layout.offsetWidth;
        const std::uint64_t offset = numberIn(_layout.offsets.subspan(entry, _layout.offsetWidth));
        if (offset < kMagic.size() || offset >= _layout.objects.size())
            return failOf(number, "lies outside of the objects.");
        const Input bytes = _layout.objects.subspan(static_cast<std::size_t>(offset));
        return Object{static_cast<Kind>(bytes[0] >> 4U), static_cast<std::uint8_t>(bytes[0] & 0xFU),
                      bytes.subspan(1)};
    }

    std::optional<PropertyList> value(std::uint64_t number, std::size_t depth) {
        const auto found = object(number);
        if (!found) return std::nullopt;
        auto value = valueOf(*found, depth);
        if (!value) failAs(number, *found);
        return value;
    }

    // What is said when nothing more exact has been said.
    void failAs(std::uint64_t number, const Object& object) {
        failOf(number, text("is {}, and is malformed or cut.", nameOf(object.kind)));
    }

    std::optional<PropertyList> valueOf(const Object& object, std::size_t depth) {
        switch (object.kind) {
            case Kind::Constant:
                return readConstant(object);
            case Kind::Integer:
                return readInteger(object);
            case Kind::Real:
                return readReal(object);
            case Kind::Date:
                return readDate(object);
            case Kind::Data:
                return data(object);
            case Kind::Ascii:
            case Kind::Utf16:
                return string(object);
            case Kind::Array:
                return array(object, depth);
            case Kind::Dictionary:
                return dictionary(object, depth);
        }
        return std::nullopt;
    }

    std::optional<PropertyList> data(const Object& object) {
        const auto bytes = readData(object);
        if (!bytes) return std::nullopt;
        if (!_budget.takeBytes(bytes->size())) return fail(kTooManyBytes);
        return PropertyList(Bytes(bytes->begin(), bytes->end()));
    }

    std::optional<std::string> string(const Object& object) {
        auto text = readText(object);
        if (text && !_budget.takeBytes(text->size())) return fail(kTooManyBytes);
        return text;
    }

    std::optional<std::string> key(std::uint64_t number) {
        const auto found = object(number);
        if (!found) return std::nullopt;
        auto key = string(*found);
        if (!key) failOf(number, "is a key, and not well-formed text.");
        return key;
    }

    std::optional<PropertyList> array(Object object, std::size_t depth) {
        const auto count = takeCount(object, _layout.referenceWidth);
        if (!count || !enter(*count, depth)) return std::nullopt;
        PropertyList::Array array;
        array.reserve(*count);
        for (std::size_t at = 0; at < *count; ++at) {
            auto each = value(reference(object, at), depth + 1);
            if (!each) return std::nullopt;
            array.push_back(std::move(*each));
        }
        return PropertyList(std::move(array));
    }

    // The references of all keys come before those of all values.
    std::optional<PropertyList> dictionary(Object object, std::size_t depth) {
        const auto count = takeCount(object, 2 * _layout.referenceWidth);
        if (!count || !enter(2 * *count, depth)) return std::nullopt;
        PropertyListEntries entries;
        entries.reserve(*count);
        for (std::size_t at = 0; at < *count; ++at) {
            auto name = key(reference(object, at));
            if (!name) return std::nullopt;
            auto each = value(reference(object, *count + at), depth + 1);
            if (!each) return std::nullopt;
            entries.emplace_back(std::move(*name), std::move(*each));
        }
        return dictionaryOf(std::move(entries));
    }

    // Whether one more collection, of so many contents, may be made at this depth. They are paid
    // for before any is made, so that memory set aside for collections that lie inside each other
    // never adds up to more than the budget.
    bool enter(std::size_t contents, std::size_t depth) {
        if (depth == _limits.depth) {
            fail(kTooDeep);
        } else if (!_budget.takeObjects(contents)) {
            fail(kTooManyObjects);
        } else {
            return true;
        }
        return false;
    }

    std::uint64_t reference(const Object& collection, std::size_t at) const {
        const std::size_t width = _layout.referenceWidth;
        return numberIn(collection.rest.subspan(at * width, width));
    }

    const Layout& _layout;
    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
    FirstProblem& _problem;
};

// A list without shared collections has no more values than bytes. With them, a few bytes could ask
// for as many values as there may be at all; so what a list may cost grows with its length.
PropertyListLimits limitsFor(Input data, PropertyListLimits limits) {
    constexpr std::size_t kShort = 4096;
    constexpr std::size_t kValuesOfByte = 8;
    if (data.size() < limits.objects / kValuesOfByte)
        limits.objects = std::min(limits.objects, kShort + data.size() * kValuesOfByte);
    return limits;
}

}  // namespace

bool isBinaryPropertyList(Input data) {
    return data.size() >= kMagic.size() &&
           std::ranges::equal(data.first(kMagic.size()), kMagic,
                              [](std::uint8_t byte, char letter) { return char(byte) == letter; });
}

PropertyListReading readBinaryPropertyList(Input data, const PropertyListLimits& limits) {
    FirstProblem problem;
    const auto layout = readLayout(data, problem);
    const PropertyListLimits own = limitsFor(data, limits);
    auto value = layout ? Reader(*layout, own, problem).read() : std::nullopt;
    return std::move(problem).with(std::move(value));
}

}  // namespace vlm::platform
