// What a probe can try: one thing each, named on its command line.

#pragma once

#include <span>
#include <string>

namespace vlm::test {

using Arguments = std::span<const std::string>;

// Tries what the first argument names, with the others, and answers the error number, 0 when it
// worked. Throws for a name or a number of arguments that there is not.
int attempt(Arguments arguments);

// Each answers -1 when it knows no attempt of this name.
int attemptOnFiles(const std::string& name, Arguments arguments);
int attemptPrograms(const std::string& name, Arguments arguments);
int attemptCalls(const std::string& name, Arguments arguments);

}  // namespace vlm::test
