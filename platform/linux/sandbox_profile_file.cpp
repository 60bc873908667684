#include "platform/linux/sandbox_profile_file.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>
#include <system_error>
#include <utility>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/read_to_end.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

constexpr std::size_t kLargestProfile = std::size_t{64} << 10U;  // bytes

std::string systemMessage() { return std::generic_category().message(errno); }

// The file's content, or none and the reason in `error`.
std::optional<std::string> readSmallFile(const std::string& path, std::string& error) {
    // A pipe in the file's place must not make the program wait.
    const FileDescriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    struct stat status {};
    if (!file || fstat(file.get(), &status) != 0) {
        error = systemMessage();
        return std::nullopt;
    }
    if (!S_ISREG(status.st_mode)) {
        error = "not a plain file";
        return std::nullopt;
    }
    const auto content =
        readToEnd(file.get(), kLargestProfile, static_cast<std::size_t>(status.st_size));
    if (!content) {
        error = systemMessage();
        return std::nullopt;
    }
    if (content->size() > kLargestProfile) {
        error = text("larger than {} bytes", kLargestProfile);
        return std::nullopt;
    }
    return std::string(content->begin(), content->end());
}

}  // namespace

SandboxProfileAnswer readInstalledProfile(std::string_view name,
                                          std::vector<SandboxParameter> parameters) {
    if (name.empty() || name.find_first_of(std::string_view("/\0", 2)) != std::string_view::npos)
        return {std::nullopt, text("\"{}\" cannot name a profile", name)};
    std::error_code failure;
    const auto program = std::filesystem::read_symlink("/proc/self/exe", failure);
    if (failure) return {std::nullopt, text("/proc/self/exe: {}", failure.message())};
    const std::string folder = program.parent_path().parent_path();
    parameters.push_back({"INSTALL_DIR", folder});

    const std::string path = text("{}/share/vlm/sandbox/{}.profile", folder, name);
    std::string error;
    const auto content = readSmallFile(path, error);
    if (!content) return {std::nullopt, text("{}: {}", path, error)};
    auto answer = parseSandboxProfile(*content, parameters);
    if (answer.profile) answer.profile->file = path;
    if (!answer.profile) answer.errorText = text("{}: {}", path, answer.errorText);
    return answer;
}

}  // namespace vlm::platform
