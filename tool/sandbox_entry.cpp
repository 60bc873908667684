#include "tool/sandbox_entry.h"

#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

#include "platform/platform.h"
#include "platform/sandbox.h"
#include "util/bind_utils.h"
#include "util/tool_identifier.h"

namespace vlm {

using platform::FolderAnswer;

namespace {

// The longest path that a profile's parameter may hold, with the zero that ends it.
constexpr std::size_t kPathBufferSize = 1024;

int number(std::errc error) { return static_cast<int>(error); }

FolderAnswer withinBuffer(FolderAnswer answer) {
    if (answer.path.size() < kPathBufferSize) return answer;
    return {"", number(std::errc::filename_too_long)};
}

// The path in its canonical absolute form. Like any other path, the empty one names no file; where
// there is no path at all, the argument is invalid.
FolderAnswer resolved(const char* path) {
    if (!path) return {"", number(std::errc::invalid_argument)};
    if (*path == '\0') return {"", number(std::errc::no_such_file_or_directory)};
    std::error_code error;
    const auto canonical = std::filesystem::canonical(path, error);
    if (error) return {"", error.value()};
    return withinBuffer({canonical.string(), 0});
}

// None, after a line in the log, when the path cannot be resolved.
std::optional<std::string> realPath(std::string_view kind, const char* path) {
    const auto answer = resolved(path);
    if (!answer.path.empty()) return answer.path;
    BindUtils::log().error("Error calling realpath on the {} directory path: {}.", kind,
                           answer.errorNumber);
    return std::nullopt;
}

std::optional<std::string> privateFolder(std::string_view kind, const FolderAnswer& given) {
    const auto folder = withinBuffer(given);
    if (!folder.path.empty()) return realPath(kind, folder.path.c_str());
    BindUtils::log().error("Couldn't retrieve {} directory path: {}.", kind, folder.errorNumber);
    return std::nullopt;
}

}  // namespace

bool initSandbox() {
    auto& sandbox = platform::current().sandbox();
    const auto temporary = privateFolder("private temporary", sandbox.userTemporaryFolder());
    if (!temporary) return false;
    const auto cache = privateFolder("private cache", sandbox.userCacheFolder());
    if (!cache) return false;
    const auto home = realPath("home", std::getenv("HOME"));
    if (!home) return false;

    const auto answer = sandbox.enter(kToolIdentifier, {{"KESTRA_USER_CACHE_DIR", *cache},
                                                        {"KESTRA_USER_TEMP_DIR", *temporary},
                                                        {"HOME_DIR", *home}});
    if (answer.status == platform::kSuccess) return true;
    BindUtils::log().error("Couldn't initialize sandbox: {} ({})", answer.status, answer.errorText);
    return false;
}

}  // namespace vlm
