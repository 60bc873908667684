// The objects of a binary property list that hold no others, and how any object is cut up.
//
// Errors: none for an object that is malformed, or of a kind or width that holds no value.

#pragma once

#include <optional>
#include <span>
#include <string>

#include "platform/binary_property_list.h"
#include "platform/property_list.h"

namespace vlm::platform::binary_format {

using Input = std::span<const std::uint8_t>;

std::uint64_t numberIn(Input bytes);

// An object cut into its marker's halves and the bytes that may belong to it.
struct Object {
    Kind kind = Kind::Constant;
    std::uint8_t lowerHalf = 0;
    Input rest;
};

// How many elements of so many bytes each the object announces, taking a long count off its rest.
// None when they would not fit into the input, so that a count can be trusted from here on.
std::optional<std::size_t> takeCount(Object& object, std::size_t elementSize);

std::optional<PropertyList> readConstant(const Object& object);
std::optional<PropertyList> readInteger(Object object);
std::optional<PropertyList> readReal(Object object);
std::optional<PropertyList> readDate(const Object& object);
std::optional<Input> readData(Object object);

// ASCII and UTF-16 alike, as UTF-8; none for any other object.
std::optional<std::string> readText(const Object& object);

}  // namespace vlm::platform::binary_format
