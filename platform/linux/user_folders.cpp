#include "platform/linux/user_folders.h"

#include <fcntl.h>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <utility>
#include <vector>

#include "platform/linux/file_descriptor.h"
#include "platform/linux/open_or_make_folder.h"

namespace vlm::platform {

namespace {

constexpr const char* kOwnFolder = "vlm";
constexpr mode_t kPrivate = S_IRWXU;
constexpr mode_t kOthers = S_IRWXG | S_IRWXO;

// Where a private folder may be: the folders below the base are made when they are missing.
struct Place {
    std::string base;
    std::vector<std::string> shared;     // belong to the user, other programs use them too
    std::vector<std::string> exclusive;  // ours alone
};

// Only folders of the user's own are ever opened here, so nobody else's folder gets a new one.
FileDescriptor openOrMake(const FileDescriptor& parent, const std::string& name, int flags) {
    return openOrMakeFolder(parent, name, kPrivate, O_RDONLY | O_DIRECTORY | O_CLOEXEC | flags);
}

bool isOwned(const struct stat& folder, mode_t forbidden) {
    if (folder.st_uid == geteuid() && (folder.st_mode & forbidden) == 0) return true;
    errno = EACCES;
    return false;
}

// Whether nobody but the user and his groups can put things into this folder, or replace what lies
// there: from the latter the sticky bit protects a folder that all may write to.
bool isSharedSafely(const FileDescriptor& folder) {
    struct stat status {};
    if (fstat(folder.get(), &status) != 0) return false;
    return isOwned(status, (status.st_mode & S_ISVTX) != 0 ? 0 : S_IWOTH);
}

bool isPrivate(const FileDescriptor& folder) {
    struct stat status {};
    return fstat(folder.get(), &status) == 0 && isOwned(status, kOthers);
}

FolderAnswer openPlace(const Place& place) {
    std::string path = place.base;
    FileDescriptor folder(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!folder || !isSharedSafely(folder)) return {{}, errno};
    // People move a shared folder to another disk and leave a link; ours has no reason to be one.
    for (const auto& name : place.shared) {
        path.append("/").append(name);
        folder = openOrMake(folder, name, 0);
        if (!folder || !isSharedSafely(folder)) return {{}, errno};
    }
    for (const auto& name : place.exclusive) {
        path.append("/").append(name);
        folder = openOrMake(folder, name, O_NOFOLLOW);
        if (!folder || !isPrivate(folder)) return {{}, errno};
    }
    return {std::move(path), 0};
}

FolderAnswer firstUsable(const std::vector<Place>& places) {
    FolderAnswer answer{{}, ENOENT};
    for (const auto& each : places) {
        answer = openPlace(each);
        if (answer.errorNumber == 0) break;
    }
    return answer;
}

std::vector<Place> cachePlaces(const UserPlaces& from, const std::vector<std::string>& exclusive) {
    std::vector<Place> places;
    if (from.cacheHome) places.push_back({*from.cacheHome, {}, exclusive});
    if (from.home) places.push_back({*from.home, {".cache"}, exclusive});
    if (from.accountHome) places.push_back({*from.accountHome, {".cache"}, exclusive});
    return places;
}

// The variable may name a folder that is not there yet: that one is made too, in a folder of the
// user's.
Place configuredPlace(std::string folder) {
    while (folder.size() > 1 && folder.back() == '/') folder.pop_back();
    const auto slash = folder.rfind('/');
    if (slash == 0 || access(folder.c_str(), F_OK) == 0) return {folder, {}, {}};
    return {folder.substr(0, slash), {folder.substr(slash + 1)}, {}};
}

std::optional<Place> configurationPlace(const UserPlaces& from) {
    if (from.configurationHome) return configuredPlace(*from.configurationHome);
    const auto& home = from.home ? from.home : from.accountHome;
    if (!home) return std::nullopt;
    return Place{*home, {".config"}, {}};
}

std::optional<std::string> environmentFolder(const char* name) {
    // secure_getenv: whoever starts a set-user-id program chooses no folder of its user.
    const char* value = secure_getenv(name);
    if (value == nullptr || *value != '/') return std::nullopt;
    return std::string(value);
}

std::optional<std::string> accountHomeFolder() {
    std::array<char, 16384> buffer{};
    struct passwd entry {};
    struct passwd* found = nullptr;
    if (getpwuid_r(geteuid(), &entry, buffer.data(), buffer.size(), &found) != 0 ||
        found == nullptr || found->pw_dir == nullptr || *found->pw_dir != '/')
        return std::nullopt;
    return std::string(found->pw_dir);
}

}  // namespace

UserPlaces UserPlaces::ofThisEnvironment() {
    return {environmentFolder("XDG_RUNTIME_DIR"), environmentFolder("XDG_CACHE_HOME"),
            environmentFolder("HOME"), std::nullopt, environmentFolder("XDG_CONFIG_HOME")};
}

UserPlaces UserPlaces::ofThisProcess() {
    auto places = ofThisEnvironment();
    places.accountHome = accountHomeFolder();
    return places;
}

FolderAnswer userTemporaryFolder(const UserPlaces& from) {
    auto places = cachePlaces(from, {kOwnFolder, "tmp"});
    if (from.runtimeFolder) places.insert(places.begin(), {*from.runtimeFolder, {}, {kOwnFolder}});
    return firstUsable(places);
}

FolderAnswer userCacheFolder(const UserPlaces& from) {
    return firstUsable(cachePlaces(from, {kOwnFolder}));
}

std::optional<std::string> configurationHome(const UserPlaces& from) {
    auto place = configurationPlace(from);
    if (!place) return std::nullopt;
    for (const auto& name : place->shared) place->base.append("/").append(name);
    return std::move(place->base);
}

FolderAnswer userConfigurationFolder(const UserPlaces& from) {
    auto place = configurationPlace(from);
    if (!place) return {{}, ENOENT};
    place->shared.emplace_back(kOwnFolder);
    return openPlace(*place);
}

}  // namespace vlm::platform
