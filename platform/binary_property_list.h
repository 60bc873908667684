// The binary format 1.0, shared by its reader and its writer.
//
// Layout: "bplist00"; the objects, each a marker byte and what it announces; a table of the
//         objects' offsets; a trailer of 32 bytes that says where the table and the top object are
//         and how wide offsets and references are. All numbers are big-endian. Collections refer
//         to their contents by number, so that several may share one object.

#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace vlm::platform::binary_format {

inline constexpr std::string_view kMagic = "bplist00";
inline constexpr std::size_t kTrailerSize = 32;
inline constexpr std::size_t kTrailerUnused = 6;  // bytes before the first one that counts

// The upper half of a marker tells the kind; the lower half a count, a width or which constant.
enum class Kind : std::uint8_t {
    Constant = 0x0,
    Integer = 0x1,  // of 1 << lower half bytes
    Real = 0x2,     // likewise
    Date = 0x3,
    Data = 0x4,
    Ascii = 0x5,
    Utf16 = 0x6,  // counted in units of two bytes
    Array = 0xA,
    Dictionary = 0xD,
};

inline constexpr std::uint8_t kFalse = 0x8;
inline constexpr std::uint8_t kTrue = 0x9;
inline constexpr std::uint8_t kDateWidth = 0x3;
inline constexpr std::uint8_t kLongCount = 0xF;  // the count follows as an integer object

}  // namespace vlm::platform::binary_format
