// MachineFiles: the files of a machine, of this one or of one whose disk lies in a folder.
//
// Errors: what cannot be read is not there.

#pragma once

#include <initializer_list>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace vlm::control::doctor {

class MachineFiles {
public:
    // An empty root is this machine's own.
    explicit MachineFiles(std::string root = {}) : _root(std::move(root)) {}

    const std::string& root() const { return _root; }
    bool has(const std::string& path) const;

    // The first of the paths that is there.
    std::optional<std::string> firstOf(const std::vector<std::string>& paths) const;

    // The text of a plain file of a sensible size.
    std::optional<std::string> text(const std::string& path) const;

    // The names in a folder, sorted.
    std::vector<std::string> names(const std::string& folder) const;

private:
    std::string _root;
};

// Below each folder that packages and administrators install into: "share/x" is "/usr/share/x" and
// "/usr/local/share/x".
std::vector<std::string> installed(const std::string& path);

// Likewise in each folder that libraries lie in.
std::vector<std::string> amongLibraries(const MachineFiles& files, const std::string& path);

}  // namespace vlm::control::doctor
