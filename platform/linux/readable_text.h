// readable(): text from elsewhere as a part of one line for people.
//
// Characters that act instead of showing become escapes (\n, \x1b), ill-formed UTF-8 becomes
// U+FFFD, and what is beyond the bound is cut off between two characters, with kCutMark in its
// place. So text of a stranger can neither begin a line of its own nor steer a terminal.
//
// Threads: any. Errors: none.

#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace vlm::platform {

std::string readable(std::string_view text, std::size_t mostBytes);

}  // namespace vlm::platform
