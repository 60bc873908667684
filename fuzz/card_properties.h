// What must hold for every input whatever that comes from a card's worker, from whoever starts one,
// or from where wrapped unlock keys are kept.

#pragma once

#include <cstdint>
#include <span>

namespace vlm::fuzz {

// A message that is understood can be written again, and is then understood as the same.
bool workerRequestIsSound(std::span<const std::uint8_t> data);
bool workerAnswerIsSound(std::span<const std::uint8_t> data);

// Data that is a wrapped unlock key consists of its parts, from the first byte to the last, and
// what it gives a card to open is within the bounds of a request. Nobody guesses one that can be
// opened.
bool wrappedUnlockKeyIsSound(std::span<const std::uint8_t> data);

}  // namespace vlm::fuzz
