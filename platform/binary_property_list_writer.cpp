#include <algorithm>
#include <array>
#include <bit>
#include <cstring>

#include "platform/binary_property_list.h"
#include "platform/seen_set.h"
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

// Writes into memory that is known to be large enough.
class Cursor {
public:
    explicit Cursor(std::uint8_t* place) : _place(place) {}

    std::uint8_t* place() const { return _place; }
    void goBackTo(std::uint8_t* place) { _place = place; }

    // Big-endian.
    void putNumber(std::uint64_t number, std::size_t width) {
        for (std::size_t byte = width; byte-- > 0; number >>= 8U)
            _place[byte] = static_cast<std::uint8_t>(number);
        _place += width;
    }

    void putMarker(Kind kind, std::uint64_t lowerHalf) {
        *_place++ = static_cast<std::uint8_t>(static_cast<std::uint64_t>(kind) << 4U | lowerHalf);
    }

    void putInteger(std::uint64_t number) {
        const std::size_t width = widthOf(number);
        putMarker(Kind::Integer, static_cast<std::uint64_t>(std::countr_zero(width)));
        putNumber(number, width);
    }

    void putCount(Kind kind, std::size_t count) {
        if (count < kLongCount) return putMarker(kind, count);
        putMarker(kind, kLongCount);
        putInteger(count);
    }

    void putBytes(const void* bytes, std::size_t size) {
        if (size > 0) std::memcpy(_place, bytes, size);
        _place += size;
    }

private:
    std::uint8_t* _place;
};

// What a marker with a count takes.
std::size_t countBytes(std::size_t count) {
    return count < kLongCount ? 1 : 1 + 1 + widthOf(count);
}

bool isAscii(std::string_view text) {
    std::uint64_t bits = 0;
    for (; text.size() >= sizeof bits; text.remove_prefix(sizeof bits)) {
        std::memcpy(&bits, text.data(), sizeof bits);
        if ((bits & 0x8080808080808080U) != 0) return false;
    }
    return std::ranges::all_of(text,
                               [](char byte) { return static_cast<unsigned char>(byte) < 0x80; });
}

// Puts what is neither text nor a collection.
struct ScalarPutter {
    Cursor& output;

    void operator()(bool value) const { output.putMarker(Kind::Constant, value ? kTrue : kFalse); }
    void operator()(std::int64_t value) const {
        output.putInteger(static_cast<std::uint64_t>(value));
    }
    // The 16-byte form, since eight bytes are read as signed.
    void operator()(std::uint64_t value) const {
        output.putMarker(Kind::Integer, 4);
        output.putNumber(0, 8);
        output.putNumber(value, 8);
    }
    void operator()(double value) const { putDouble(Kind::Real, value); }
    void operator()(PropertyList::Date date) const { putDouble(Kind::Date, date.secondsSince2001); }
    void operator()(const Bytes& bytes) const {
        output.putCount(Kind::Data, bytes.size());
        output.putBytes(bytes.data(), bytes.size());
    }

private:
    void putDouble(Kind kind, double value) const {
        output.putMarker(kind, kDateWidth);
        output.putNumber(std::bit_cast<std::uint64_t>(value), 8);
    }
};

// ASCII where the text is ASCII; false when it is not UTF-8.
bool putText(Cursor& output, const std::string& text) {
    if (isAscii(text)) {
        output.putCount(Kind::Ascii, text.size());
        output.putBytes(text.data(), text.size());
        return true;
    }
    const auto units = utf8ToUtf16(text);
    if (!units) return false;
    output.putCount(Kind::Utf16, units->size());
    for (const char16_t unit : *units) output.putNumber(unit, 2);
    return true;
}

// The room that a value needs at the most, counted before anything is written: so nothing that is
// too large is begun, and nothing moves while it is written.
class Room {
public:
    explicit Room(const PropertyListLimits& limits) : _limits(limits), _budget(limits) {}

    // False when the value is not within the limits.
    bool addTop(const PropertyList& value) { return _budget.takeObjects(1) && add(value, 0); }

    std::size_t scalars = 0;
    std::size_t sharable = 0;  // of them, texts and bytes
    std::size_t collections = 0;
    std::size_t references = 0;

    std::size_t objects() const { return scalars + collections; }
    std::size_t bytes() const {
        const std::size_t table = kMagic.size() + _bytes + references * widthOf(objects());
        return table + objects() * widthOf(table) + kTrailerSize;
    }

private:
    bool add(const PropertyList& value, std::size_t depth) {
        return value.visit([&](const auto& held) { return add(held, depth); });
    }
    bool add(bool, std::size_t) { return addScalar(1); }
    bool add(std::int64_t value, std::size_t) {
        return addScalar(1 + widthOf(static_cast<std::uint64_t>(value)));
    }
    bool add(std::uint64_t, std::size_t) { return addScalar(1 + 2 * 8); }
    bool add(double, std::size_t) { return addScalar(1 + 8); }
    bool add(PropertyList::Date, std::size_t) { return addScalar(1 + 8); }
    bool add(const std::string& text, std::size_t) {
        if (!_budget.takeBytes(text.size())) return false;
        ++sharable;
        if (isAscii(text)) return addScalar(countBytes(text.size()) + text.size());
        // A character of one byte takes two, of two or three bytes two, of four bytes four.
        return addScalar(countBytes(text.size()) + 2 * text.size());
    }
    bool add(const Bytes& bytes, std::size_t) {
        ++sharable;
        return _budget.takeBytes(bytes.size()) &&
               addScalar(countBytes(bytes.size()) + bytes.size());
    }
    bool add(const PropertyList::Array& array, std::size_t depth) {
        return addCollection(array.size(), depth) &&
               std::ranges::all_of(array,
                                   [&](const PropertyList& each) { return add(each, depth + 1); });
    }
    bool add(const PropertyList::Dictionary& dictionary, std::size_t depth) {
        return addCollection(2 * dictionary.size(), depth) &&
               std::ranges::all_of(dictionary, [&](const auto& entry) {
                   return add(entry.first, depth) && add(entry.second, depth + 1);
               });
    }

    bool addScalar(std::size_t bytes) {
        _bytes += bytes;
        ++scalars;
        return true;
    }
    bool addCollection(std::size_t size, std::size_t depth) {
        if (depth == _limits.depth || !_budget.takeObjects(size)) return false;
        _bytes += countBytes(size);
        ++collections;
        references += size;
        return true;
    }

    const PropertyListLimits& _limits;
    Budget _budget;
    std::size_t _bytes = 0;  // of scalars and of counts
};

// Numbers the values on first sight, a collection before its contents, so that the top object is
// number 0. Scalars are written at once; collections behind them, since how wide a reference is
// depends on how many objects there are in the end.
class Writer {
public:
    explicit Writer(const Room& room)
        : _list(room.bytes()),
          _output(_list.data()),
          _seen(room.sharable),
          _references(room.references) {
        _offsets.reserve(room.objects());
        _collections.reserve(room.collections);
    }

    // None when a text is not UTF-8, or the list takes more bytes than these.
    std::optional<Bytes> write(const PropertyList& value, std::size_t mostBytes) {
        _output.putBytes(kMagic.data(), kMagic.size());
        if (!add(value)) return std::nullopt;
        putCollections();
        putEnd();
        _list.resize(used());
        if (_list.size() > mostBytes) return std::nullopt;
        return std::move(_list);
    }

private:
    using Number = std::uint32_t;

    struct Collection {
        Number number = 0;
        Kind kind = Kind::Array;
        std::size_t begin = 0;  // in _references
        std::size_t size = 0;
    };

    std::size_t used() const { return static_cast<std::size_t>(_output.place() - _list.data()); }

    std::optional<Number> add(const PropertyList& value) {
        return value.visit([this](const auto& held) { return add(held); });
    }

    // Numbers and dates each get an object: it is hardly larger than what shares it, and much
    // faster made than looked for.
    template <typename Scalar>
    std::optional<Number> add(const Scalar& scalar) {
        const Number number = addObject();
        ScalarPutter{_output}(scalar);
        return number;
    }

    std::optional<Number> add(const Bytes& bytes) {
        std::uint8_t* const begin = _output.place();
        ScalarPutter{_output}(bytes);
        return known(begin);
    }

    // A list may hold very many of these, and there are only two.
    std::optional<Number> add(bool value) {
        auto& number = _booleans[value ? 1 : 0];
        if (!number) {
            number = addObject();
            ScalarPutter{_output}(value);
        }
        return number;
    }

    std::optional<Number> add(const std::string& text) {
        std::uint8_t* const begin = _output.place();
        if (!putText(_output, text)) return std::nullopt;
        return known(begin);
    }

    std::optional<Number> add(const PropertyList::Array& array) {
        const Collection self = addCollection(Kind::Array, array.size());
        std::size_t place = self.begin;
        for (const PropertyList& each : array)
            if (!refer(place++, add(each))) return std::nullopt;
        return self.number;
    }

    // All keys come before all values.
    std::optional<Number> add(const PropertyList::Dictionary& dictionary) {
        const Collection self = addCollection(Kind::Dictionary, 2 * dictionary.size());
        std::size_t place = self.begin;
        for (const auto& entry : dictionary)
            if (!refer(place++, add(entry.first))) return std::nullopt;
        for (const auto& entry : dictionary)
            if (!refer(place++, add(entry.second))) return std::nullopt;
        return self.number;
    }

    // One that begins where writing goes on.
    Number addObject() {
        _offsets.push_back(used());
        return static_cast<Number>(_offsets.size() - 1);
    }

    Collection addCollection(Kind kind, std::size_t size) {
        _collections.push_back({addObject(), kind, _referencesUsed, size});
        _referencesUsed += size;
        return _collections.back();
    }

    bool refer(std::size_t place, std::optional<Number> to) {
        if (to) _references[place] = *to;
        return to.has_value();
    }

    // The number of the text or the bytes that were written last; taken back when it was there
    // before. Each says how long it is, so one that begins with all of another is equal to it.
    Number known(std::uint8_t* begin) {
        const std::span scalar(begin, static_cast<std::size_t>(_output.place() - begin));
        const auto number = static_cast<Number>(_offsets.size());
        const Number first = _seen.findOrAdd(scalar, number, [&](Number other) {
            return std::memcmp(_list.data() + _offsets[other], begin, scalar.size()) == 0;
        });
        if (first == number)
            _offsets.push_back(static_cast<std::size_t>(begin - _list.data()));
        else
            _output.goBackTo(begin);
        return first;
    }

    // Some readers ask that the number of objects and the table's own offset fit as well.
    std::size_t referenceWidth() const { return widthOf(_offsets.size()); }

    void putCollections() {
        const std::size_t width = referenceWidth();
        for (const auto& [number, kind, begin, size] : _collections) {
            _offsets[number] = used();
            _output.putCount(kind, kind == Kind::Dictionary ? size / 2 : size);
            for (const Number reference : std::span(_references).subspan(begin, size))
                _output.putNumber(reference, width);
        }
    }

    void putEnd() {
        const std::size_t table = used();
        const std::size_t width = widthOf(table);
        for (const std::size_t offset : _offsets) _output.putNumber(offset, width);
        _output.putNumber(0, kTrailerUnused);
        _output.putNumber(width, 1);
        _output.putNumber(referenceWidth(), 1);
        _output.putNumber(_offsets.size(), 8);
        _output.putNumber(0, 8);
        _output.putNumber(table, 8);
    }

    Bytes _list;
    Cursor _output;                     // in _list
    SeenSet _seen;                      // of texts and bytes, by number
    std::vector<std::size_t> _offsets;  // by number
    std::array<std::optional<Number>, 2> _booleans;
    std::vector<Collection> _collections;
    std::vector<Number> _references;
    std::size_t _referencesUsed = 0;
};

}  // namespace

std::optional<Bytes> writeBinaryPropertyList(const PropertyList& value,
                                             const PropertyListLimits& limits) {
    Room room(limits);
    if (!room.addTop(value)) return std::nullopt;
    return Writer(room).write(value, limits.bytes);
}

}  // namespace vlm::platform
