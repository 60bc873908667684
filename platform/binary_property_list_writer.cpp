#include <algorithm>
#include <bit>

#include "platform/binary_property_list.h"
#include "platform/binary_property_list_numbering.h"
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

std::size_t referencesOf(const WrittenObject& object) {
    if (object.kind == Kind::Array) return object.count;
    return object.kind == Kind::Dictionary ? 2 * object.count : 0;
}

std::size_t sizeOf(const WrittenObject& object, std::size_t referenceWidth) {
    const std::size_t longCount = object.count < kLongCount ? 0 : 1 + widthOf(object.count);
    switch (object.kind) {
        case Kind::Constant:
            return 1;
        case Kind::Integer:
            return 1 + (object.isAboveSigned ? 16 : widthOf(object.number));
        case Kind::Real:
        case Kind::Date:
            return 1 + 8;
        case Kind::Data:
        case Kind::Ascii:
            return 1 + longCount + object.count;
        case Kind::Utf16:
            return 1 + longCount + 2 * object.count;
        case Kind::Array:
        case Kind::Dictionary:
            return 1 + longCount + referencesOf(object) * referenceWidth;
    }
    return 0;
}

// Fills bytes from the front, which are as many as it takes.
class Output {
public:
    explicit Output(std::span<std::uint8_t> bytes) : _bytes(bytes) {}

    std::size_t written() const { return _written; }

    void putNumber(std::uint64_t number, std::size_t width) {
        const auto place = take(width);
        for (std::size_t at = width; at-- > 0; number >>= 8U)
            place[at] = static_cast<std::uint8_t>(number);
    }

    void putMarker(Kind kind, std::uint64_t lowerHalf) {
        putNumber((static_cast<std::uint64_t>(kind) << 4U) | lowerHalf, 1);
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

    void putBytes(std::string_view bytes) { std::ranges::copy(bytes, take(bytes.size()).begin()); }

private:
    std::span<std::uint8_t> take(std::size_t count) {
        const auto place = _bytes.subspan(_written, count);
        _written += count;
        return place;
    }

    std::span<std::uint8_t> _bytes;
    std::size_t _written = 0;
};

// The 16-byte form, of which only the lower half is ever needed: eight bytes are read as signed.
void putAboveSigned(Output& output, std::uint64_t number) {
    output.putMarker(Kind::Integer, 4);
    output.putNumber(0, 8);
    output.putNumber(number, 8);
}

void putUtf16(Output& output, const WrittenObject& text) {
    output.putCount(text.kind, text.count);
    for (const char16_t unit : utf8ToUtf16(text.bytes()).value_or(u"")) output.putNumber(unit, 2);
}

void putReferences(Output& output, std::span<const std::uint32_t> references, std::size_t width) {
    for (const std::uint32_t reference : references) output.putNumber(reference, width);
}

void put(Output& output, const WrittenObject& object, const WrittenObjects& written,
         std::size_t referenceWidth) {
    switch (object.kind) {
        case Kind::Constant:
            return output.putMarker(object.kind, object.number);
        case Kind::Integer:
            return object.isAboveSigned ? putAboveSigned(output, object.number)
                                        : output.putInteger(object.number);
        case Kind::Real:
        case Kind::Date:
            output.putMarker(object.kind, kDateWidth);
            return output.putNumber(object.number, 8);
        case Kind::Data:
        case Kind::Ascii:
            output.putCount(object.kind, object.count);
            return output.putBytes(object.bytes());
        case Kind::Utf16:
            return putUtf16(output, object);
        case Kind::Array:
        case Kind::Dictionary:
            output.putCount(object.kind, object.count);
            return putReferences(
                output, std::span(written.references).subspan(object.number, referencesOf(object)),
                referenceWidth);
    }
}

}  // namespace

std::optional<Bytes> writeBinaryPropertyList(const PropertyList& value,
                                             const PropertyListLimits& limits) {
    const auto written = numberObjects(value, limits);
    if (!written) return std::nullopt;
    const auto& objects = written->objects;

    // Some readers ask that the number of objects and the table's own offset fit as well.
    const std::size_t referenceWidth = widthOf(objects.size());
    std::size_t table = kMagic.size();
    for (const WrittenObject& object : objects) table += sizeOf(object, referenceWidth);
    const std::size_t offsetWidth = widthOf(table);
    const std::size_t tableSize = objects.size() * offsetWidth;
    const std::size_t size = table + tableSize + kTrailerSize;
    if (size > limits.bytes) return std::nullopt;

    Bytes bytes(size);
    const std::span whole(bytes);
    Output output(whole.first(table));
    Output offsets(whole.subspan(table, tableSize));
    Output trailer(whole.last(kTrailerSize));
    output.putBytes(kMagic);
    for (const WrittenObject& object : objects) {
        offsets.putNumber(output.written(), offsetWidth);
        put(output, object, *written, referenceWidth);
    }
    trailer.putNumber(0, kTrailerUnused);
    trailer.putNumber(offsetWidth, 1);
    trailer.putNumber(referenceWidth, 1);
    trailer.putNumber(objects.size(), 8);
    trailer.putNumber(0, 8);
    trailer.putNumber(table, 8);
    return bytes;
}

}  // namespace vlm::platform
