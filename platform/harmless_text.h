// Text of a stranger (a card, a message, a file) in a form that is safe to show.
//
// Threads: any. Errors: none.

#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace vlm::platform {

// Whether the character acts on a terminal or a line instead of showing: control characters, line
// breaks, changes of the writing direction.
bool actsInsteadOfShowing(char32_t character);

// More than anybody reads of one text in a log line or a message.
inline constexpr std::size_t kMostShownCharacters = 1024;
inline constexpr std::size_t kAllCharacters = std::string_view::npos;

// What stands in place of the rest of a text that was cut.
inline constexpr std::string_view kCutMark = "...";

// The text with every such character, and each piece that is no UTF-8, as U+FFFD, so that it can
// neither forge a line nor rewrite one. Beyond `most` characters it is cut, and says so.
std::string harmlessText(std::string_view text, std::size_t most = kMostShownCharacters);

}  // namespace vlm::platform
