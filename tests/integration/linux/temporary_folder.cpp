#include "tests/integration/linux/temporary_folder.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <system_error>

namespace vlm::test {

TemporaryFolder::TemporaryFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "vlm-test-XXXXXX").string();
    if (!::mkdtemp(pattern.data()) || ::chmod(pattern.c_str(), 0755) != 0)
        throw std::system_error(errno, std::generic_category(), pattern);
    _path = pattern;
}

TemporaryFolder::~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(_path, ignored);
}

std::filesystem::path TemporaryFolder::write(const std::filesystem::path& name,
                                             const std::string& text) const {
    const auto file = _path / name;
    std::filesystem::create_directories(file.parent_path());
    std::ofstream stream(file, std::ios::binary);
    stream << text;
    if (!stream.flush()) throw std::system_error(errno, std::generic_category(), file.string());
    return file;
}

}  // namespace vlm::test
