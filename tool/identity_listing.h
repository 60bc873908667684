// The listing of the inserted cards' identities: card by card those that are paired and used for
// authentication, those that are paired and not used, and those that can be paired.

#pragma once

#include <map>
#include <string>
#include <string_view>

#include "tool/console.h"

namespace vlm {

// Prints the rows under their title, ordered by their values, after an empty line when something
// was printed before; nothing when there are no rows. Answers whether anything is printed by now.
bool dumpList(const std::map<std::string, std::string>& rows, std::string_view title,
              bool printedBefore, Console& console);

// Prints the listing; the answer is an exit status.
int listIdentities(Console& console);

}  // namespace vlm
