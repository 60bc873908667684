// Text that a card brought along, for screens, logs and messages.

#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace vlm::service {

inline constexpr std::size_t kCardTextLength = 256;

// The text made harmless (platform/harmless_text.h), without the blanks and zeros that cards fill
// their fields up with, and cut to `most` characters.
std::string cardText(std::string_view text, std::size_t most = kCardTextLength);

}  // namespace vlm::service
