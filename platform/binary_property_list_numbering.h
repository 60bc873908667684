// The objects that a value is written as, and their numbers.
//
// Shapes: numbers are given on first sight, a collection's before those of its contents, so the top
//         object is number 0. Scalars that are equal are one object.
// Owns:   nothing of the value, which must outlive what is made of it.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

#include "platform/binary_property_list.h"
#include "platform/property_list.h"

namespace vlm::platform::binary_format {

// Kept small, since there is one for nearly every value.
struct WrittenObject {
    Kind kind = Kind::Constant;
    bool isAboveSigned = false;  // an integer
    std::size_t count = 0;       // of a collection, text or data, as the format counts
    std::uint64_t number = 0;    // what a scalar is, or its bits; a collection's first reference;
                                 // how many bytes there are of text and data
    const char* data = nullptr;  // those bytes; the text is UTF-8

    std::string_view bytes() const {
        return data ? std::string_view(data, number) : std::string_view();
    }
};

struct WrittenObjects {
    std::vector<WrittenObject> objects;
    std::vector<std::uint32_t> references;  // of each collection in one piece, keys before values
};

// None for a value that the format cannot hold, or beyond the limits.
std::optional<WrittenObjects> numberObjects(const PropertyList& value,
                                            const PropertyListLimits& limits);

}  // namespace vlm::platform::binary_format
