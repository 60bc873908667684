// The command line: one run acts on the options in their order, then carries out one command.
//
// Threads:  one, the first of the process.
// Blocking: a command waits for the hints service.
// Errors:   a printed line and kExitFailure.
// In tests: tests/unit/tool/command_line_test.cpp and the tests of each command

#pragma once

#include "tool/console.h"

namespace vlm {

// Runs the tool with arguments; the answer is an exit status.
int runCommandLine(int argc, char* argv[], Console& console);

}  // namespace vlm
