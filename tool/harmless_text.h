#pragma once

#include <string>
#include <string_view>

namespace vlm {

// The text with every character that would act on a terminal instead of showing (control
// characters, line breaks, changes of writing direction, bytes that are no text) as U+FFFD, so
// that a name from a card can neither forge a line nor rewrite one.
std::string harmlessText(std::string_view text);

}  // namespace vlm
