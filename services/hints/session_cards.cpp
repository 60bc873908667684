#include "services/hints/session_cards.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <string_view>
#include <system_error>

#include "platform/harmless_text.h"
#include "platform/linux/file_descriptor.h"
#include "platform/linux/read_to_end.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

namespace fs = std::filesystem;
using platform::FileDescriptor;
using platform::text;

constexpr std::size_t kMostNameBytes = 64;
constexpr std::size_t kMostTokenBytes = 2048;

bool isSession(std::string_view name) {
    return !name.empty() && name.size() <= kMostNameBytes && std::ranges::all_of(name, [](char c) {
        return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
    });
}

bool isToken(std::string_view token) {
    return token.starts_with("pkcs11:") && token.size() <= kMostTokenBytes &&
           std::ranges::all_of(token, [](char c) { return c > ' ' && c < 0x7F; });
}

std::string failure(const std::string& path) {
    return text("{}: {}", path, std::generic_category().message(errno));
}

// Everybody may look into it, whatever the mask of this process is.
std::optional<std::string> makeFolder(const std::string& path) {
    if (mkdir(path.c_str(), 0755) == 0 ? chmod(path.c_str(), 0755) != 0 : errno != EEXIST)
        return failure(path);
    return std::nullopt;
}

bool writeLine(const FileDescriptor& file, const std::string& line) {
    return write(file.get(), line.data(), line.size()) == static_cast<ssize_t>(line.size()) &&
           fchmod(file.get(), 0644) == 0;
}

}  // namespace

std::optional<std::string> SessionCards::record(const std::string& session,
                                                const std::string& token) const {
    if (!isSession(session))
        return text("\"{}\" is no name of a session", platform::harmlessText(session));
    if (!isToken(token)) return text("\"{}\" is no token", platform::harmlessText(token));
    for (const auto& folder : {fs::path(_folder).parent_path().string(), _folder})
        if (auto problem = makeFolder(folder)) return problem;

    // The dot keeps it apart from sessions; a reader finds the old file or the new one.
    const auto staged = _folder + "/." + session;
    const auto path = _folder + "/" + session;
    unlink(staged.c_str());
    const FileDescriptor file(
        open(staged.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0644));
    if (!file || !writeLine(file, token + "\n") || rename(staged.c_str(), path.c_str()) != 0)
        return failure(path);
    return std::nullopt;
}

std::optional<std::string> SessionCards::tokenOf(const std::string& session) const {
    if (!isSession(session)) return std::nullopt;
    const FileDescriptor file(open((_folder + "/" + session).c_str(),
                                   O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    const auto content = file ? platform::readToEnd(file.get(), kMostTokenBytes + 1) : std::nullopt;
    if (!content || content->empty() || content->back() != '\n') return std::nullopt;
    std::string token(content->begin(), content->end() - 1);
    if (!isToken(token)) return std::nullopt;
    return token;
}

void SessionCards::forgetUnless(
    const std::function<bool(const std::string& session)>& isThere) const {
    std::error_code error;
    for (fs::directory_iterator file(_folder, error), end; !error && file != end;
         file.increment(error)) {
        const auto name = file->path().filename().string();
        if (isSession(name) && !isThere(name)) unlink(file->path().c_str());
    }
}

}  // namespace vlm::service
