#include <algorithm>
#include <bit>
#include <map>

#include "platform/binary_property_list.h"
#include "platform/property_list_reading.h"
#include "platform/utf.h"

namespace vlm::platform {

namespace {

using namespace binary_format;

// The narrowest of the widths that integers, offsets and references come in.
std::size_t widthOf(std::uint64_t number) {
    if (number <= 0xFF) return 1;
    if (number <= 0xFFFF) return 2;
    return number <= 0xFFFFFFFF ? 4 : 8;
}

// Bytes with what the format puts into them. `Output` is Bytes for the list and std::string for
// an object that is compared as a whole.
template <typename Output>
void putNumber(Output& output, std::uint64_t number, std::size_t width) {
    for (std::size_t byte = width; byte-- > 0;)
        output.push_back(static_cast<typename Output::value_type>(
            static_cast<std::uint8_t>(number >> (byte * 8))));
}

template <typename Output>
void putMarker(Output& output, Kind kind, std::uint64_t lowerHalf) {
    putNumber(output, (static_cast<std::uint64_t>(kind) << 4U) | lowerHalf, 1);
}

template <typename Output>
void putInteger(Output& output, std::uint64_t number) {
    const std::size_t width = widthOf(number);
    putMarker(output, Kind::Integer, static_cast<std::uint64_t>(std::countr_zero(width)));
    putNumber(output, number, width);
}

template <typename Output>
void putCount(Output& output, Kind kind, std::size_t count) {
    if (count < kLongCount) return putMarker(output, kind, count);
    putMarker(output, kind, kLongCount);
    putInteger(output, count);
}

// The 16-byte form, of which only the lower half is ever needed: eight bytes are read as signed.
void putAboveSigned(std::string& output, std::uint64_t number) {
    putMarker(output, Kind::Integer, 4);
    putNumber(output, 0, 8);
    putNumber(output, number, 8);
}

// The object of a text, ASCII where it is ASCII; none when it is not UTF-8.
std::optional<std::string> encodeText(const std::string& text) {
    const auto isAscii = [](char byte) { return static_cast<unsigned char>(byte) < 0x80; };
    std::string object;
    if (std::ranges::all_of(text, isAscii)) {
        putCount(object, Kind::Ascii, text.size());
        return object + text;
    }
    const auto units = utf8ToUtf16(text);
    if (!units) return std::nullopt;
    putCount(object, Kind::Utf16, units->size());
    for (const char16_t unit : *units) putNumber(object, unit, 2);
    return object;
}

void putDouble(std::string& output, Kind kind, double value) {
    putMarker(output, kind, kDateWidth);
    putNumber(output, std::bit_cast<std::uint64_t>(value), 8);
}

// The object of a value that is neither text nor a collection.
std::string encodeScalar(const PropertyList& value) {
    std::string object;
    if (const auto boolean = value.boolean()) {
        putMarker(object, Kind::Constant, *boolean ? kTrue : kFalse);
    } else if (const auto integer = value.integer()) {
        putInteger(object, static_cast<std::uint64_t>(*integer));
    } else if (const auto above = value.unsignedInteger()) {
        putAboveSigned(object, *above);
    } else if (const auto real = value.real()) {
        putDouble(object, Kind::Real, *real);
    } else if (const auto date = value.date()) {
        putDouble(object, Kind::Date, date->secondsSince2001);
    } else if (const auto* bytes = value.bytes()) {
        putCount(object, Kind::Data, bytes->size());
        object.append(bytes->begin(), bytes->end());
    }
    return object;
}

class Writer {
public:
    explicit Writer(const PropertyListLimits& limits) : _limits(limits), _budget(limits) {}

    std::optional<Bytes> write(const PropertyList& value) {
        if (!_budget.takeObjects(1) || !add(value, 0)) return std::nullopt;
        return serialise();
    }

private:
    // A scalar, encoded once for all values that are equal to it, or a collection's references.
    struct Object {
        const std::string* scalar = nullptr;
        Kind kind = Kind::Array;
        std::vector<std::size_t> references;
    };

    // Adds the value with all that it holds and answers its number. Numbers are given on first
    // sight, a collection's before those of its contents, so the top object is number 0.
    std::optional<std::size_t> add(const PropertyList& value, std::size_t depth) {
        if (const auto* array = value.array()) {
            const auto number = addCollection(Kind::Array, array->size(), depth);
            return number && addContents(*number, *array, depth + 1) ? number : std::nullopt;
        }
        if (const auto* dictionary = value.dictionary()) {
            const auto number = addCollection(Kind::Dictionary, 2 * dictionary->size(), depth);
            return number && addContents(*number, *dictionary, depth + 1) ? number : std::nullopt;
        }
        if (const auto* text = value.text()) return addText(*text);
        if (const auto* bytes = value.bytes(); bytes && !_budget.takeBytes(bytes->size()))
            return std::nullopt;
        return addScalar(encodeScalar(value));
    }

    std::optional<std::size_t> addCollection(Kind kind, std::size_t references, std::size_t depth) {
        if (depth == _limits.depth || !_budget.takeObjects(references)) return std::nullopt;
        _objects.push_back({nullptr, kind, {}});
        _objects.back().references.reserve(references);
        return _objects.size() - 1;
    }

    bool addContents(std::size_t number, const PropertyList::Array& array, std::size_t depth) {
        return std::ranges::all_of(
            array, [&](const PropertyList& each) { return refer(number, add(each, depth)); });
    }

    // All keys come before all values.
    bool addContents(std::size_t number, const PropertyList::Dictionary& dictionary,
                     std::size_t depth) {
        return std::ranges::all_of(
                   dictionary,
                   [&](const auto& entry) { return refer(number, addText(entry.first)); }) &&
               std::ranges::all_of(dictionary, [&](const auto& entry) {
                   return refer(number, add(entry.second, depth));
               });
    }

    bool refer(std::size_t from, std::optional<std::size_t> to) {
        if (to) _objects[from].references.push_back(*to);
        return to.has_value();
    }

    std::optional<std::size_t> addText(const std::string& text) {
        if (!_budget.takeBytes(text.size())) return std::nullopt;
        auto object = encodeText(text);
        if (!object) return std::nullopt;
        return addScalar(std::move(*object));
    }

    std::size_t addScalar(std::string object) {
        const auto [known, isNew] = _scalars.try_emplace(std::move(object), _objects.size());
        if (isNew) _objects.push_back({&known->first, {}, {}});
        return known->second;
    }

    std::optional<Bytes> serialise() const {
        // Some readers ask that the number of objects and the table's own offset fit as well.
        const std::size_t referenceWidth = widthOf(_objects.size());
        Bytes output(kMagic.begin(), kMagic.end());
        std::vector<std::size_t> offsets;
        offsets.reserve(_objects.size());
        for (const Object& object : _objects) {
            if (output.size() > _limits.bytes) return std::nullopt;
            offsets.push_back(output.size());
            put(output, object, referenceWidth);
        }

        const std::size_t table = output.size();
        const std::size_t offsetWidth = widthOf(table);
        for (const std::size_t offset : offsets) putNumber(output, offset, offsetWidth);

        putNumber(output, 0, kTrailerUnused);
        putNumber(output, offsetWidth, 1);
        putNumber(output, referenceWidth, 1);
        putNumber(output, _objects.size(), 8);
        putNumber(output, 0, 8);
        putNumber(output, table, 8);
        if (output.size() > _limits.bytes) return std::nullopt;
        return output;
    }

    static void put(Bytes& output, const Object& object, std::size_t referenceWidth) {
        if (object.scalar) {
            output.insert(output.end(), object.scalar->begin(), object.scalar->end());
            return;
        }
        const std::size_t count = object.references.size();
        putCount(output, object.kind, object.kind == Kind::Dictionary ? count / 2 : count);
        for (const std::size_t reference : object.references)
            putNumber(output, reference, referenceWidth);
    }

    const PropertyListLimits& _limits;
    PropertyListBudget _budget;
    std::vector<Object> _objects;
    std::map<std::string, std::size_t> _scalars;  // by encoding; objects point at its keys
};

}  // namespace

std::optional<Bytes> writeBinaryPropertyList(const PropertyList& value,
                                             const PropertyListLimits& limits) {
    return Writer(limits).write(value);
}

}  // namespace vlm::platform
