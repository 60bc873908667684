#include "services/hints/owned_files.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <system_error>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/linux/file_descriptor.h"
#include "platform/linux/read_to_end.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

namespace fs = std::filesystem;
using platform::FileDescriptor;
using platform::text;

std::string failure() { return std::generic_category().message(errno); }

std::string notCounting(const std::string& path, const std::string& why) {
    return text("{} does not count: {}", platform::harmlessText(path), why);
}

// O_NONBLOCK: a pipe in its place must not make this wait.
constexpr int kFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

// Why what is open does not count; `kind` is S_IFDIR or S_IFREG.
std::optional<std::string> distrust(const FileDescriptor& opened, uid_t owner, mode_t kind) {
    struct stat status {};
    if (fstat(opened.get(), &status) != 0) return failure();
    if ((status.st_mode & S_IFMT) != kind) return "it is not of the right kind";
    if (status.st_uid == owner && (status.st_mode & (S_IWGRP | S_IWOTH)) == 0) return std::nullopt;
    return text("not only the user with the id {} can write it", owner);
}

// The names to read, in their order.
std::vector<std::string> namesIn(const std::string& folder) {
    std::vector<std::string> names;
    std::error_code error;
    for (fs::directory_iterator file(folder, error), end;
         !error && file != end && names.size() <= kMostOwnedFiles; file.increment(error))
        if (auto name = file->path().filename().string(); !name.starts_with('.'))
            names.push_back(std::move(name));
    std::ranges::sort(names);
    return names;
}

struct OpenedFolder {
    FileDescriptor folder;
    std::optional<std::string> problem;
};

OpenedFolder openOwnedFolder(const std::string& path, uid_t owner) {
    OpenedFolder opened{FileDescriptor(open(path.c_str(), kFlags | O_DIRECTORY)), std::nullopt};
    const bool isMissing = !opened.folder && errno == ENOENT;
    auto why = opened.folder ? distrust(opened.folder, owner, S_IFDIR) : failure();
    if (why && !isMissing) opened.problem = notCounting(path, *why);
    return opened;
}

class Reading {
public:
    Reading(const std::string& folder, uid_t owner) : _folder(folder), _owner(owner) {}

    OwnedFiles read() && {
        const auto opened = openOwnedFolder(_folder, _owner);
        if (opened.problem)
            _files.problems.push_back(*opened.problem);
        else if (opened.folder)
            for (const auto& name : namesIn(_folder)) readFile(opened.folder, name);
        return std::move(_files);
    }

private:
    void problem(const std::string& path, const std::string& why) {
        _files.problems.push_back(notCounting(path, why));
    }

    void readFile(const FileDescriptor& folder, const std::string& name) {
        const auto path = _folder + "/" + name;
        if (_files.contents.size() >= kMostOwnedFiles)
            return problem(path, "there are too many files beside it");
        const FileDescriptor file(openat(folder.get(), name.c_str(), kFlags));
        if (!file) return problem(path, errno == ELOOP ? "it is a symbolic link" : failure());
        if (const auto why = distrust(file, _owner, S_IFREG)) return problem(path, *why);
        const auto most = std::min(kMostOwnedFileBytes, kMostOwnedBytes - _size);
        auto content = platform::readToEnd(file.get(), most);
        if (!content) return problem(path, failure());
        if (content->size() > most) return problem(path, "it is too large");
        _size += content->size();
        _files.contents.emplace(path, std::move(*content));
    }

    const std::string& _folder;
    const uid_t _owner;
    std::size_t _size = 0;
    OwnedFiles _files;
};

}  // namespace

OwnedFiles readOwnedFiles(const std::string& folder, uid_t owner) {
    return Reading(folder, owner).read();
}

std::optional<std::string> distrustOfFolder(const std::string& folder, uid_t owner) {
    return openOwnedFolder(folder, owner).problem;
}

void addStamps(const std::string& folder, FileStamps& stamps) {
    const timespec now = platform::clockOfFiles();
    const auto add = [&](const std::string& path) {
        struct stat status {};
        if (lstat(path.c_str(), &status) != 0) return;
        auto& stamp = stamps[path];
        if (platform::isSettled(status.st_ctim, now)) stamp = platform::FileStamp::of(status);
    };
    add(folder);
    for (const auto& name : namesIn(folder)) add(platform::text("{}/{}", folder, name));
}

}  // namespace vlm::service
