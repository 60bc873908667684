// The room that a value needs at the most as a binary property list, counted before anything is
// written: so nothing that is too large is begun, and nothing moves while it is written.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

#include "platform/binary_property_list.h"
#include "platform/property_list.h"

namespace vlm::platform::binary_format {

struct Room {
    std::size_t scalars = 0;
    std::size_t collections = 0;
    std::size_t references = 0;
    std::size_t contents = 0;  // bytes of scalars, and of the collections' markers and counts
    std::vector<std::uint32_t> hashes = {};  // of texts and bytes, in the order of writing

    std::size_t objects() const { return scalars + collections; }
    std::size_t bytes() const;  // of the whole list
    bool isNumberable() const;  // whether 32 bits hold every object's number and offset
};

// None for a value that is not within the limits.
std::optional<Room> roomFor(const PropertyList& value, const PropertyListLimits& limits);

}  // namespace vlm::platform::binary_format
