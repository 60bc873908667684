// TemporaryFolder: a folder of a test's own, removed with everything in it at the end.

#pragma once

#include <filesystem>
#include <string>

namespace vlm::test {

class TemporaryFolder {
public:
    // Mode 0755, so that a child that runs as another user gets in. Throws when there is no room.
    TemporaryFolder();
    ~TemporaryFolder();
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    const std::filesystem::path& path() const { return _path; }

    // Writes a file, with the folders above it, and answers its path.
    std::filesystem::path write(const std::filesystem::path& name, const std::string& text) const;

private:
    std::filesystem::path _path;
};

}  // namespace vlm::test
