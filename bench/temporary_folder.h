// A folder for one measurement, gone with the object.

#pragma once

#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>

namespace vlm::bench {

class TemporaryFolder {
public:
    TemporaryFolder() {
        std::string path = std::filesystem::temp_directory_path() / "vlm-bench-XXXXXX";
        if (mkdtemp(path.data()) == nullptr) std::exit(2);
        _path = path;
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(_path, ignored);
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    const std::filesystem::path& path() const { return _path; }

private:
    std::filesystem::path _path;
};

}  // namespace vlm::bench
