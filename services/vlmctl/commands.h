// The commands of vlmctl. Each takes its arguments, says what it has to say, and answers the exit
// status of the program.
//
// Threads:  one.
// Blocking: tokens, pairings and the answer for one user wait for the hints service; the doctor
// does
//           for a moment.
// In tests: tests/unit/vlmctl, tests/integration/vlmctl

#pragma once

#include <string>
#include <vector>

#include "services/vlmctl/arguments.h"
#include "services/vlmctl/output.h"

namespace vlm::control {

// Every known setting, its value and where that comes from.
int listSettings(const Arguments& arguments, Output& output);

int getSetting(const Arguments& arguments, Output& output);

// Write this machine's record. Management decides over them: what it forces is left alone.
int setSetting(const Arguments& arguments, Output& output);
int unsetSetting(const Arguments& arguments, Output& output);

// What is wrong in a property list.
int checkFile(const Arguments& arguments, Output& output);

// The identities of the inserted cards.
int listTokens(const Arguments& arguments, Output& output);

// Who is paired with what: asked of the hints service, or read from its database by root.
int listPairings(const Arguments& arguments, Output& output);

// What keeps cards from working, and what to do about it. For a machine in a folder, what its files
// tell.
int examine(const Arguments& arguments, Output& output);

// Runs the command line that these words make.
int runCommandLine(const std::vector<std::string>& words, Output& output);

}  // namespace vlm::control
