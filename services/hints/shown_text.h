#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "platform/types.h"

namespace vlm::service {

// Text from a message or a card in a form that is safe on a terminal, in a log and in a sentence:
// control characters, changes of the writing direction and bytes that are no text become U+FFFD,
// and what is longer than `most` characters is cut and ends in "...".
std::string shownText(std::string_view text, std::size_t most = 128);

// A public-key hash as people read it: upper-case hexadecimal.
std::string shownHash(const platform::Bytes& hash);

}  // namespace vlm::service
