#include "platform/linux/preferences_folders.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <utility>

#include "platform/linux/open_or_make_folder.h"
#include "platform/linux/user_folders.h"

namespace vlm::platform {

namespace {

// Enough to find what lies below. To open a folder for more takes the right to list it, which a
// confined process has for its own folders only, not for the home folder above them.
constexpr int kPassThrough = O_PATH | O_DIRECTORY | O_CLOEXEC;

bool isTrusted(const FileDescriptor& opened, const PreferencesFolder& folder) {
    struct stat status {};
    if (fstat(opened.get(), &status) != 0) return false;
    if (folder.trusts(status)) return true;
    errno = EACCES;
    return false;
}

FileDescriptor openOrMake(const FileDescriptor& parent, const std::string& name,
                          const PreferencesFolder& folder) {
    return openOrMakeFolder(parent, name, folder.folderMode, kPassThrough | O_NOFOLLOW);
}

// The base is made as well, when the folder that it belongs in is there.
FileDescriptor openBase(const PreferencesFolder& folder) {
    FileDescriptor base(open(folder.base.c_str(), kPassThrough));
    if (base || errno != ENOENT) return base;
    const std::filesystem::path path(folder.base);
    const FileDescriptor parent(open(path.parent_path().c_str(), kPassThrough));
    if (!parent || !isTrusted(parent, folder)) return {};
    return openOrMake(parent, path.filename(), folder);
}

PreferencesFolder machineFolder(const char* name) { return {"/etc", {"vlm", name}}; }

std::string thisHost() {
    std::array<char, HOST_NAME_MAX + 1> name{};
    gethostname(name.data(), name.size() - 1);
    std::string machineId;
    std::ifstream("/etc/machine-id") >> machineId;
    return hostIdentifier(machineId, name.data());
}

std::optional<PreferencesFolder> currentUserFolder() {
    auto home = configurationHome(UserPlaces::ofThisEnvironment());
    if (!home) home = configurationHome(UserPlaces::ofThisProcess());
    if (!home) return std::nullopt;
    return PreferencesFolder{
        std::move(*home), {"vlm", "hosts", thisHost()}, geteuid(), S_IWOTH, 0700, 0600};
}

bool isHexadecimal(char each) {
    return (each >= '0' && each <= '9') || (each >= 'a' && each <= 'f');
}

}  // namespace

std::string PreferencesFolder::path() const {
    std::string path = base;
    for (const auto& each : own) path.append("/").append(each);
    return path;
}

bool PreferencesFolder::trusts(const struct stat& status) const {
    return status.st_uid == owner && (status.st_mode & forbidden) == 0;
}

PreferencesFolders PreferencesFolders::ofThisMachine() {
    return {machineFolder("managed"), machineFolder("preferences"), currentUserFolder()};
}

FileDescriptor openFolder(const PreferencesFolder& folder) {
    return FileDescriptor(open(folder.path().c_str(), kPassThrough));
}

FileDescriptor openTrustedFolder(const PreferencesFolder& folder) {
    FileDescriptor opened = openBase(folder);
    if (!opened || !isTrusted(opened, folder)) return {};
    for (const auto& name : folder.own) {
        opened = openOrMake(opened, name, folder);
        if (!opened || !isTrusted(opened, folder)) return {};
    }
    // Once more for reading, which is what it takes to have the disk keep the folder.
    return FileDescriptor(openat(opened.get(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
}

std::string hostIdentifier(const std::string& machineId, const std::string& hostName) {
    constexpr std::size_t kDigits = 32;
    if (machineId.size() == kDigits && std::ranges::all_of(machineId, isHexadecimal))
        return machineId;
    std::string name;
    for (const char each : hostName) {
        const bool isPlain = (each >= 'a' && each <= 'z') || (each >= 'A' && each <= 'Z') ||
                             (each >= '0' && each <= '9') || each == '-';
        name += isPlain || (each == '.' && !name.empty()) ? each : '_';
    }
    return name.empty() ? "localhost" : name;
}

}  // namespace vlm::platform
