#include <array>
#include <cstring>
#include <vector>

#include "platform/binary_property_list_output.h"
#include "platform/binary_property_list_room.h"
#include "platform/seen_set.h"

namespace vlm::platform {

namespace {

using namespace binary_format;

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
    const auto room = roomFor(value, limits);
    if (!room || room->objects() > SeenSet::kMostPieces) return std::nullopt;
    return Writer(*room).write(value, limits.bytes);
}

}  // namespace vlm::platform
