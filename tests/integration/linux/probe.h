// How a test asks the program platform_probe.

#pragma once

#include <string>
#include <vector>

namespace vlm::test {

inline constexpr int kProbeAnswersNone = 3;  // exit status

// The command line of a question: "user-id alice", "log SUBSYSTEM CATEGORY LEVEL TEXT", ...
std::vector<std::string> probe(const std::vector<std::string>& question);

}  // namespace vlm::test
