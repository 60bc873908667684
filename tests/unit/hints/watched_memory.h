// The memory of a test's program: made scarce, and searched for secrets when it is given back.

#pragma once

#include <cstddef>
#include <limits>
#include <string_view>

namespace vlm::test {

inline constexpr std::size_t kAnySize = std::numeric_limits<std::size_t>::max();

// The program gets no larger piece of memory than this, in bytes.
extern std::size_t largestPiece;

// Pieces given back with this text in them are counted; no text, no search.
extern std::string_view secret;
extern int piecesWithSecret;

}  // namespace vlm::test
