// SandboxProfile: what a confined process may still do, read from a profile's text.
//
// A profile is lines of one rule each; what no rule allows is denied. Empty lines and lines that
// begin with '#' say nothing.
//
//     read PATH      read the file, or all files and folders beneath the folder
//     write PATH     that, and change, make and remove files and folders there
//     socket unix    open sockets of the unix family
//
// A path runs to the end of its line. It is absolute, or begins with $(NAME), the value of a
// parameter. No value is ever looked at as syntax, whatever characters it holds.
//
// Threads:  values. Blocking: no.
// Errors:   a text that breaks any of these rules gives no profile but the line and the reason.
// In tests: tests/integration/sandbox/sandbox_profile_test.cpp

#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/sandbox.h"

namespace vlm::platform {

enum class PathAccess { Read, Write };

struct PathRule {
    PathAccess access = PathAccess::Read;
    std::string path;
    std::size_t line = 0;  // of the profile, from 1

    bool operator==(const PathRule&) const = default;
};

struct SandboxProfile {
    std::string file;  // that it was read from
    std::vector<PathRule> paths;
    bool unixSockets = false;
};

struct SandboxProfileAnswer {
    std::optional<SandboxProfile> profile;
    std::string errorText;  // why there is none; "line 3: ..." when a line is to blame
};

SandboxProfileAnswer parseSandboxProfile(std::string_view text,
                                         const std::vector<SandboxParameter>& parameters);

}  // namespace vlm::platform
