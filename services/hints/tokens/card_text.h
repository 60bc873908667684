// Text that a card brought along, made harmless for screens, logs and messages.

#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace vlm::service {

inline constexpr std::size_t kCardTextLength = 256;

// Well-formed UTF-8 of at most `length` characters. Each ill-formed piece, control character and
// character that changes the direction of writing or breaks a line becomes U+FFFD; blanks and
// zeros at both ends are taken off.
std::string harmlessText(std::string_view text, std::size_t length = kCardTextLength);

}  // namespace vlm::service
