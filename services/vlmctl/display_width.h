#pragma once

#include <cstddef>
#include <string_view>

namespace vlm::control {

// How many columns of a terminal the text takes: two for the wide characters of East Asia and for
// most emoji, none for marks that combine with the character before them, one for every other. The
// C library would answer by the locale, and nothing at all in "C".
std::size_t displayWidth(std::string_view text);

}  // namespace vlm::control
