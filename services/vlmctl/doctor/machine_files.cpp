#include "services/vlmctl/doctor/machine_files.h"

#include <algorithm>
#include <filesystem>
#include <system_error>

#include "platform/text.h"
#include "services/vlmctl/read_file.h"

namespace vlm::control::doctor {

namespace {

namespace fs = std::filesystem;

constexpr std::size_t kMostBytes = std::size_t{1} << 20U;

}  // namespace

bool MachineFiles::has(const std::string& path) const {
    std::error_code error;
    return fs::exists(_root + path, error);
}

std::optional<std::string> MachineFiles::firstOf(const std::vector<std::string>& paths) const {
    const auto found = std::ranges::find_if(paths, [this](const auto& path) { return has(path); });
    if (found == paths.end()) return std::nullopt;
    return *found;
}

std::optional<std::string> MachineFiles::text(const std::string& path) const {
    const auto content = readFile(_root + path, kMostBytes);
    if (!content.bytes) return std::nullopt;
    return std::string(content.bytes->begin(), content.bytes->end());
}

std::vector<std::string> MachineFiles::names(const std::string& folder) const {
    std::vector<std::string> names;
    std::error_code error;
    for (fs::directory_iterator file(_root + folder, error), end; !error && file != end;
         file.increment(error))
        names.push_back(file->path().filename().string());
    std::ranges::sort(names);
    return names;
}

std::vector<std::string> installed(const std::string& path) {
    return {"/usr/" + path, "/usr/local/" + path};
}

std::vector<std::string> amongLibraries(const MachineFiles& files, const std::string& path) {
    std::vector<std::string> paths;
    for (const std::string folder : {"/usr/lib", "/usr/local/lib", "/lib", "/usr/lib64"}) {
        paths.push_back(platform::text("{}/{}", folder, path));
        // The libraries of each processor may have a folder of their own.
        for (const auto& name : files.names(folder))
            if (name.find("-linux-") != std::string::npos)
                paths.push_back(platform::text("{}/{}/{}", folder, name, path));
    }
    return paths;
}

}  // namespace vlm::control::doctor
