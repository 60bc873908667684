// The module that brings the desktop's toolkit into a process that shows a window.
//
// A command that shows none must not pay for loading a toolkit, so it is linked to none of this:
// the module is loaded when the first window is. Both sides are installed together and are built
// from the same headers. Nothing is thrown across.
//
// Behind it: platform/linux/qt/

#pragma once

#include "platform/windowing.h"

namespace vlm::platform {

// C functions of the module, by the names that they have there.

// The same object for the whole life of the process. Its toolkit starts with the first window.
inline constexpr const char* kWindowingEntry = "vlmWindowing";
using WindowingEntry = Windowing* (*)();

// Runs the toolkit's loop on the main queue's thread, and calls `dispatch` each time when the
// descriptor can be read. Answers 0 when the loop was ended, -1 when there is no toolkit to run.
inline constexpr const char* kRunLoopEntry = "vlmRunLoop";
using RunLoopEntry = int (*)(int wakeDescriptor, void (*dispatch)(void* context), void* context);

// Ends the loop that runs, from within what it calls.
inline constexpr const char* kEndLoopEntry = "vlmEndLoop";
using EndLoopEntry = void (*)();

}  // namespace vlm::platform
