// The objects of a binary property list that hold no others, written into memory that is known to
// be large enough; and how many bytes an object takes.

#pragma once

#include <bit>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "platform/binary_property_list.h"
#include "platform/property_list.h"

namespace vlm::platform::binary_format {

// The narrowest of the widths that integers, offsets and references come in.
inline std::size_t widthOf(std::uint64_t number) {
    if (number <= 0xFF) return 1;
    if (number <= 0xFFFF) return 2;
    return number <= 0xFFFFFFFF ? 4 : 8;
}

// What a marker with a count takes.
inline std::size_t countBytes(std::size_t count) {
    return count < kLongCount ? 1 : 1 + 1 + widthOf(count);
}

// Writes into memory that is known to be large enough. Behind a number it may overwrite up to seven
// bytes that nothing was written to yet; the trailer, which comes last and is as long as it says,
// leaves room for that.
class Cursor {
public:
    explicit Cursor(std::uint8_t* place) : _place(place) {}

    std::uint8_t* place() const { return _place; }
    void goBackTo(std::uint8_t* place) { _place = place; }

    // Big-endian, of at least one byte.
    void putNumber(std::uint64_t number, std::size_t width) {
        number <<= 8 * (sizeof number - width);
        if constexpr (std::endian::native == std::endian::little)
            number = __builtin_bswap64(number);
        std::memcpy(_place, &number, sizeof number);
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
bool putText(Cursor& output, const std::string& text);

}  // namespace vlm::platform::binary_format
