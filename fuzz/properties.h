// What must hold for every input whatever: the fuzzers look for one for which it does not, and the
// unit tests replay the corpora.

#pragma once

#include <cstdint>
#include <span>

#include "platform/types.h"

namespace vlm::fuzz {

// Data that is read as a property list can be written, and is then read as the same value.
bool propertyListRoundTrips(std::span<const std::uint8_t> data);

// A reply with the data as its error entry has failed, with an error of the framework's domain
// that can be sent on unchanged.
bool replyErrorIsSound(std::span<const std::uint8_t> data);

}  // namespace vlm::fuzz
