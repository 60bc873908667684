// How a table and a message show what others wrote: texts of cards, file names, times.

#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vlm::control {

// The text with everything that would act on a terminal instead of showing as U+FFFD.
std::string shown(std::string_view text);

// Seconds since 1970-01-01 00:00:00 UTC as "2024-05-01T12:00:00Z", or as the number where the
// calendar ends.
std::string pointInTime(std::int64_t seconds);

}  // namespace vlm::control
