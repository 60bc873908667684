#include <array>
#include <cstring>
#include <utility>
#include <vector>

#include "platform/binary_property_list_output.h"
#include "platform/binary_property_list_room.h"
#include "platform/repeated_hashes.h"
#include "platform/seen_set.h"

namespace vlm::platform {

namespace {

using namespace binary_format;

// Numbers the values on first sight, a collection before its contents, so that the top object is
// number 0. Scalars are written at once; collections behind them, since how wide a reference is
// depends on how many objects there are in the end.
class Writer {
public:
    explicit Writer(Room room)
        : _list(room.bytes()),
          _output(_list.data()),
          _hashes(std::move(room.hashes)),
          _nextHash(_hashes.begin()),
          _seen(keepRepeatedHashes(_hashes)),
          _references(room.references) {
        _offsets.reserve(room.objects());
        _collections.reserve(room.collections);
    }

    // None when a text is not UTF-8, or the list takes more bytes than these.
    std::optional<Bytes> write(const PropertyList& value, std::size_t mostBytes) {
        _output.putBytes(kMagic.data(), kMagic.size());
        add(value);
        if (!_isUtf8) return std::nullopt;
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
        Number size = 0;  // in references
    };

    std::size_t used() const { return static_cast<std::size_t>(_output.place() - _list.data()); }

    Number add(const PropertyList& value) {
        return value.visit([this](const auto& held) { return add(held); });
    }

    // Numbers and dates each get an object: it is hardly larger than what shares it, and much
    // faster made than looked for.
    template <typename Scalar>
    Number add(const Scalar& scalar) {
        const Number number = addObject();
        ScalarPutter{_output}(scalar);
        return number;
    }

    Number add(const Bytes& bytes) {
        std::uint8_t* const begin = _output.place();
        ScalarPutter{_output}(bytes);
        return known(begin);
    }

    // A list may hold very many of these, and there are only two.
    Number add(bool value) {
        auto& number = _booleans[value ? 1 : 0];
        if (!number) {
            number = addObject();
            ScalarPutter{_output}(value);
        }
        return *number;
    }

    Number add(const std::string& text) {
        std::uint8_t* const begin = _output.place();
        if (!putText(_output, text)) _isUtf8 = false;
        return known(begin);
    }

    Number add(const PropertyList::Array& array) {
        const Number self = addObject();
        std::size_t place = addCollection(self, Kind::Array, array.size());
        for (const PropertyList& each : array) _references[place++] = add(each);
        return self;
    }

    // All keys come before all values.
    Number add(const PropertyList::Dictionary& dictionary) {
        const Number self = addObject();
        std::size_t place = addCollection(self, Kind::Dictionary, 2 * dictionary.size());
        for (const auto& entry : dictionary) _references[place++] = add(entry.first);
        for (const auto& entry : dictionary) _references[place++] = add(entry.second);
        return self;
    }

    // One that begins where writing goes on.
    Number addObject() { return addObjectAt(_output.place()); }

    Number addObjectAt(const std::uint8_t* begin) {
        _offsets.push_back(static_cast<Number>(begin - _list.data()));
        return static_cast<Number>(_offsets.size() - 1);
    }

    // Where its references go.
    std::size_t addCollection(Number number, Kind kind, std::size_t size) {
        _collections.push_back({number, kind, static_cast<Number>(size)});
        const std::size_t begin = _referencesUsed;
        _referencesUsed += size;
        return begin;
    }

    // The number of the text or the bytes that were written last; taken back when it was there
    // before. Each says how long it is, so one that begins with all of another is equal to it.
    Number known(std::uint8_t* begin) {
        const std::uint32_t hash = *_nextHash++;
        if (hash == kNoHash) return addObjectAt(begin);
        const auto size = static_cast<std::size_t>(_output.place() - begin);
        const auto number = static_cast<Number>(_offsets.size());
        const Number first = _seen.findOrAdd(hash, number, [&](Number other) {
            return std::memcmp(_list.data() + _offsets[other], begin, size) == 0;
        });
        if (first == number) return addObjectAt(begin);
        _output.goBackTo(begin);
        return first;
    }

    // Some readers ask that the number of objects and the table's own offset fit as well.
    std::size_t referenceWidth() const { return widthOf(_offsets.size()); }

    void putCollections() {
        const std::size_t width = referenceWidth();
        auto reference = _references.begin();
        for (const auto& [number, kind, size] : _collections) {
            _offsets[number] = static_cast<Number>(used());
            _output.putCount(kind, kind == Kind::Dictionary ? size / 2 : size);
            for (const auto end = reference + size; reference != end; ++reference)
                _output.putNumber(*reference, width);
        }
    }

    void putEnd() {
        const std::size_t table = used();
        const std::size_t width = widthOf(table);
        for (const Number offset : _offsets) _output.putNumber(offset, width);
        _output.putNumber(0, kTrailerUnused);
        _output.putNumber(width, 1);
        _output.putNumber(referenceWidth(), 1);
        _output.putNumber(_offsets.size(), 8);
        _output.putNumber(0, 8);
        _output.putNumber(table, 8);
    }

    Bytes _list;
    Cursor _output;                      // in _list
    std::vector<std::uint32_t> _hashes;  // of those texts and bytes that may repeat
    std::vector<std::uint32_t>::const_iterator _nextHash;
    SeenSet _seen;                 // of those texts and bytes, by number
    std::vector<Number> _offsets;  // by number
    std::array<std::optional<Number>, 2> _booleans;
    std::vector<Collection> _collections;
    std::vector<Number> _references;
    std::size_t _referencesUsed = 0;
    bool _isUtf8 = true;  // every text so far
};

}  // namespace

std::optional<Bytes> writeBinaryPropertyList(const PropertyList& value,
                                             const PropertyListLimits& limits) {
    auto room = roomFor(value, limits);
    if (!room || !room->isNumberable()) return std::nullopt;
    return Writer(*std::move(room)).write(value, limits.bytes);
}

}  // namespace vlm::platform
