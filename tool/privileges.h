// Whether the process may do what was asked, by its effective user: a set-user-id program counts
// as the user that it became. A refusal is printed.

#pragma once

#include "tool/console.h"

namespace vlm {

// True for the superuser.
bool checkRoot(Console& console);

// True for everybody else.
bool checkNoRoot(Console& console);

}  // namespace vlm
