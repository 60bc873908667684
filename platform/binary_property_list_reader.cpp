#include <algorithm>
#include <numeric>

#include "platform/binary_property_list.h"
#include "platform/binary_property_list_objects.h"

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

std::optional<Layout> readLayout(Input data) {
    if (data.size() < kMagic.size() + kTrailerSize) return std::nullopt;
    const Input trailer = data.last(kTrailerSize).subspan(kTrailerUnused);
    const Input beforeTrailer = data.first(data.size() - kTrailerSize);

    Layout layout;
    layout.offsetWidth = trailer[0];
    layout.referenceWidth = trailer[1];
    layout.objectCount = numberIn(trailer.subspan(2, 8));
    layout.topObject = numberIn(trailer.subspan(10, 8));
    const std::uint64_t table = numberIn(trailer.subspan(18, 8));

    const auto isWidth = [](std::size_t width) { return width >= 1 && width <= 8; };
    if (!isWidth(layout.offsetWidth) || !isWidth(layout.referenceWidth)) return std::nullopt;
    if (table > beforeTrailer.size()) return std::nullopt;
    layout.objects = beforeTrailer.first(static_cast<std::size_t>(table));
    layout.offsets = beforeTrailer.subspan(static_cast<std::size_t>(table));
    if (layout.objectCount > layout.offsets.size() / layout.offsetWidth) return std::nullopt;
    return layout;
}

using Entries = std::vector<PropertyList::Dictionary::Entry>;

// A key that comes more than once has its last value, in the place of the first. Found by sorting,
// since a table of hashes would have its worst case chosen by whoever made the input.
PropertyList asDictionary(Entries entries) {
    std::vector<std::size_t> order(entries.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::ranges::sort(order, [&](std::size_t left, std::size_t right) {
        const int difference = entries[left].first.compare(entries[right].first);
        return difference != 0 ? difference < 0 : left < right;
    });

    std::vector<bool> repeats(entries.size());
    for (std::size_t first = 0, at = 1; at < order.size(); ++at) {
        if (entries[order[at]].first != entries[order[first]].first) {
            first = at;
            continue;
        }
        entries[order[first]].second = std::move(entries[order[at]].second);
        repeats[order[at]] = true;
    }

    PropertyList::Dictionary dictionary;
    for (std::size_t at = 0; at < entries.size(); ++at)
        if (!repeats[at])
            dictionary.append(std::move(entries[at].first), std::move(entries[at].second));
    return dictionary;
}

// Makes values out of objects, from the top down. An object that is used twice is made twice, and
// its contents with it; the budget bounds what that can add up to, and the depth ends every cycle.
class Reader {
public:
    Reader(const Layout& layout, const PropertyListLimits& limits)
        : _layout(layout), _limits(limits), _budget(limits) {}

    std::optional<PropertyList> read() {
        if (!_budget.takeObjects(1)) return std::nullopt;
        return value(_layout.topObject, 0);
    }

private:
    std::optional<Object> object(std::uint64_t number) const {
        if (number >= _layout.objectCount) return std::nullopt;
        const auto entry = static_cast<std::size_t>(number) * _layout.offsetWidth;
        const std::uint64_t offset = numberIn(_layout.offsets.subspan(entry, _layout.offsetWidth));
        if (offset < kMagic.size() || offset >= _layout.objects.size()) return std::nullopt;
        const Input bytes = _layout.objects.subspan(static_cast<std::size_t>(offset));
        return Object{static_cast<Kind>(bytes[0] >> 4U), static_cast<std::uint8_t>(bytes[0] & 0xFU),
                      bytes.subspan(1)};
    }

    std::optional<PropertyList> value(std::uint64_t number, std::size_t depth) {
        const auto found = object(number);
        if (!found) return std::nullopt;
        switch (found->kind) {
            case Kind::Constant:
                return readConstant(*found);
            case Kind::Integer:
                return readInteger(*found);
            case Kind::Real:
                return readReal(*found);
            case Kind::Date:
                return readDate(*found);
            case Kind::Data:
                return data(*found);
            case Kind::Ascii:
            case Kind::Utf16:
                return text(*found);
            case Kind::Array:
                return array(*found, depth);
            case Kind::Dictionary:
                return dictionary(*found, depth);
        }
        return std::nullopt;
    }

    std::optional<PropertyList> data(const Object& object) {
        const auto bytes = readData(object);
        if (!bytes || !_budget.takeBytes(bytes->size())) return std::nullopt;
        return PropertyList(Bytes(bytes->begin(), bytes->end()));
    }

    std::optional<std::string> text(const Object& object) {
        auto text = readText(object);
        if (!text || !_budget.takeBytes(text->size())) return std::nullopt;
        return text;
    }

    std::optional<std::string> key(std::uint64_t number) {
        const auto found = object(number);
        return found ? text(*found) : std::nullopt;
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
        Entries entries;
        entries.reserve(*count);
        for (std::size_t at = 0; at < *count; ++at) {
            auto name = key(reference(object, at));
            if (!name) return std::nullopt;
            auto each = value(reference(object, *count + at), depth + 1);
            if (!each) return std::nullopt;
            entries.emplace_back(std::move(*name), std::move(*each));
        }
        return asDictionary(std::move(entries));
    }

    // Whether one more collection, of so many contents, may be made at this depth. They are paid
    // for before any is made, so that memory set aside for collections that lie inside each other
    // never adds up to more than the budget.
    bool enter(std::size_t contents, std::size_t depth) {
        return depth < _limits.depth && _budget.takeObjects(contents);
    }

    std::uint64_t reference(const Object& collection, std::size_t at) const {
        const std::size_t width = _layout.referenceWidth;
        return numberIn(collection.rest.subspan(at * width, width));
    }

    const Layout& _layout;
    const PropertyListLimits& _limits;
    Budget _budget;
};

}  // namespace

bool isBinaryPropertyList(Input data) {
    return data.size() >= kMagic.size() &&
           std::ranges::equal(data.first(kMagic.size()), kMagic,
                              [](std::uint8_t byte, char letter) { return char(byte) == letter; });
}

std::optional<PropertyList> readBinaryPropertyList(Input data, const PropertyListLimits& limits) {
    const auto layout = readLayout(data);
    if (!layout) return std::nullopt;
    return Reader(*layout, limits).read();
}

}  // namespace vlm::platform
