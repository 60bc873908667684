#pragma once

#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>

namespace vlm::service {

// A folder of a test's own that only this user may enter.
class PrivateFolder {
public:
    PrivateFolder() {
        std::string name = std::filesystem::temp_directory_path() / "vlm-store-XXXXXX";
        if (mkdtemp(name.data())) _path = name;
    }
    PrivateFolder(const PrivateFolder&) = delete;
    PrivateFolder& operator=(const PrivateFolder&) = delete;
    ~PrivateFolder() {
        std::error_code ignored;
        if (!_path.empty()) std::filesystem::remove_all(_path, ignored);
    }
    const std::filesystem::path& path() const { return _path; }

private:
    std::filesystem::path _path;
};

}  // namespace vlm::service
