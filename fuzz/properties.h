// What must hold for every input whatever: the fuzzers look for one for which it does not, and the
// unit tests replay the corpora.

#pragma once

#include <cstdint>
#include <span>

#include "platform/types.h"

namespace vlm::fuzz {

// The reader of one format, whatever the data looks like: it answers a value or else a problem, a
// sentence about a place within the data. The value can be written, and is then read as the same.
bool binaryPropertyListIsSound(std::span<const std::uint8_t> data);
bool xmlPropertyListIsSound(std::span<const std::uint8_t> data);
bool textPropertyListIsSound(std::span<const std::uint8_t> data);

// Data that is read as a property list of any format can be written in the binary one and, where it
// came from XML, in XML, and is then read as the same value.
bool propertyListRoundTrips(std::span<const std::uint8_t> data);

// A reply with the data as its error entry has failed, with an error of the framework's domain
// that can be sent on unchanged.
bool replyErrorIsSound(std::span<const std::uint8_t> data);

}  // namespace vlm::fuzz
